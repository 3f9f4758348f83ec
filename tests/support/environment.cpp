#include "support/environment.h"

#include <atomic>
#include <chrono>
#include <random>
#include <stdexcept>

#if defined(_WIN32)
#include <windows.h>

#include <cstdlib>
#include <process.h>
#else
#include <cstdlib>
#include <unistd.h>
#endif

namespace zeltest {

std::optional<std::string> getEnv(const char* name)
{
#if defined(_WIN32)
    char buffer[32768];
    ::SetLastError(ERROR_SUCCESS);
    const DWORD length = ::GetEnvironmentVariableA(name, buffer, sizeof buffer);
    if (length == 0 && ::GetLastError() == ERROR_ENVVAR_NOT_FOUND) {
        return std::nullopt;
    }
    return std::string(buffer, length < sizeof buffer ? length : 0);
#else
    const char* value = std::getenv(name);
    return value != nullptr ? std::optional<std::string>(value) : std::nullopt;
#endif
}

void setEnv(const char* name, const std::optional<std::string>& value)
{
#if defined(_WIN32)
    // The runtime's copy first: _putenv_s with an empty value removes the variable there and in the
    // process block, so the process block is set last.
    ::_putenv_s(name, value ? value->c_str() : "");
    ::SetEnvironmentVariableA(name, value ? value->c_str() : nullptr);
#else
    if (value) {
        ::setenv(name, value->c_str(), 1);
    } else {
        ::unsetenv(name);
    }
#endif
}

ScopedEnv::ScopedEnv(const char* name, std::optional<std::string> value) : name_(name), old_(getEnv(name))
{
    setEnv(name, value);
}

ScopedEnv::~ScopedEnv() { setEnv(name_.c_str(), old_); }

std::filesystem::path makeTempDir(const std::string& prefix)
{
    namespace fs = std::filesystem;
    static std::atomic<unsigned> counter{0};
#if defined(_WIN32)
    const auto pid = static_cast<unsigned long>(::_getpid());
#else
    const auto pid = static_cast<unsigned long>(::getpid());
#endif
    std::mt19937_64 random(static_cast<std::uint64_t>(std::chrono::steady_clock::now().time_since_epoch().count()));
    const fs::path base = fs::temp_directory_path();
    for (int attempt = 0; attempt < 100; ++attempt) {
        const fs::path candidate = base / (prefix + "-" + std::to_string(pid) + "-" + std::to_string(counter++) + "-" +
                                           std::to_string(random() % 1000000));
        std::error_code error;
        // create_directory answers false, without an error, when the folder was there already.
        if (fs::create_directory(candidate, error)) {
            return candidate;
        }
    }
    throw std::runtime_error("cannot create a temporary folder under " + base.string());
}

TempDir::TempDir(const std::string& prefix) : path_(makeTempDir(prefix)) {}

TempDir::~TempDir()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

}  // namespace zeltest
