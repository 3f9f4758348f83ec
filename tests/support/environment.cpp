#include "support/environment.h"

#include <atomic>
#include <chrono>
#include <stdexcept>

#if defined(_WIN32)
#include <windows.h>
#endif

#include <cstdlib>

namespace zeltest {

namespace {

// The variable's value as the library sees it; nullopt when it is not defined.
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

}  // namespace

ScopedEnv::ScopedEnv(const char* name, std::optional<std::string> value) : name_(name), old_(getEnv(name))
{
    setEnv(name, value);
}

ScopedEnv::~ScopedEnv() { setEnv(name_.c_str(), old_); }

// Named by the clock and a counter; a folder that exists already (another process chose the same
// name) is not taken, since create_directory answers false for it.
TempDir::TempDir(const std::string& prefix)
{
    namespace fs = std::filesystem;
    static std::atomic<unsigned> counter{0};
    const auto stamp = std::chrono::steady_clock::now().time_since_epoch().count();
    for (int attempt = 0; attempt < 100; ++attempt) {
        path_ = fs::temp_directory_path() / (prefix + "-" + std::to_string(stamp) + "-" + std::to_string(counter++));
        std::error_code error;
        if (fs::create_directory(path_, error)) {
            return;
        }
    }
    throw std::runtime_error("cannot create a temporary folder under " + fs::temp_directory_path().string());
}

TempDir::~TempDir()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

}  // namespace zeltest
