// The server's configuration file: an INI-like text of sections and "key = value" lines.
// docs/zelserverd.md describes the format.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace zelserverd {

constexpr std::uint16_t kDefaultPort = 7071;
constexpr std::uint32_t kDefaultMaxRequestBytes = 16u * 1024 * 1024;
constexpr std::string_view kDefaultJobService = "zeljob";
constexpr std::string_view kDefaultSharedResource = "DEFAULT";

struct UserConfig {
    std::string name;
    std::string password;
    std::vector<std::string> roles;
};

struct SharedResourceConfig {
    std::string name;
    std::string path;  // absolute after loading
    std::string displayName;
    std::string description;
};

struct JobServiceConfig {
    std::string name;
    std::string description;
};

struct Config {
    std::string listenHost = "127.0.0.1";
    std::uint16_t listenPort = kDefaultPort;
    unsigned workers = 2;
    std::uint32_t maxRequestBytes = kDefaultMaxRequestBytes;
    std::uint64_t maxFileBytes = UINT32_MAX;
    unsigned jobTimeoutSeconds = 0;                              // 0: no limit
    unsigned maxConnections = 64;                                // further clients are turned away
    unsigned idleTimeoutSeconds = 300;                           // between commands; 0: no limit
    unsigned ioTimeoutSeconds = 30;                              // a stalled frame, transfer or send
    std::string jobUser = "nobody";                              // runs the jobs when the server is root
    std::string ssoSecret;                                       // empty: single sign-on refused
    std::map<std::string, std::vector<std::string>> roleRights;  // roles the file defines
    std::vector<UserConfig> users;
    std::vector<SharedResourceConfig> sharedResources;
    std::vector<JobServiceConfig> jobServices;

    const UserConfig* findUser(std::string_view name) const;
    const SharedResourceConfig* findSharedResource(std::string_view name) const;
    const JobServiceConfig* findJobService(std::string_view name) const;
};

// Parses the text of a configuration file. Relative shared resource paths are taken from
// `baseDir`. Returns an empty string on success, else "line N: what is wrong".
std::string parseConfig(std::string_view text, const std::string& baseDir, Config& out);
std::string loadConfigFile(const std::string& path, Config& out);

}  // namespace zelserverd
