#pragma once
// Process environment and scratch folders for tests, the same on POSIX and Windows.

#include <filesystem>
#include <optional>
#include <string>

namespace zeltest {

// Sets (or, with nullopt, removes) an environment variable for one test and puts the old state back
// afterwards. On Windows both the process environment block, which the library reads, and the C
// runtime's copy are changed; an empty value stays defined there too.
class ScopedEnv {
public:
    ScopedEnv(const char* name, std::optional<std::string> value);
    ScopedEnv(const char* name, const char* value)
        : ScopedEnv(name, value != nullptr ? std::optional<std::string>(value) : std::nullopt)
    {}
    ~ScopedEnv();
    ScopedEnv(const ScopedEnv&) = delete;
    ScopedEnv& operator=(const ScopedEnv&) = delete;

private:
    std::string name_;
    std::optional<std::string> old_;
};

// A fresh, empty folder under the system's temporary folder, removed with everything in it when the
// object goes. `prefix` starts the folder's name, so a leftover tells which test made it.
class TempDir {
public:
    explicit TempDir(const std::string& prefix = "zel-test");
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    const std::filesystem::path& path() const { return path_; }
    std::string string() const { return path_.string(); }

private:
    std::filesystem::path path_;
};

}  // namespace zeltest
