// Who may do what: rights, roles, and the three ways to sign in (password, user token,
// single sign-on). Rights always come from the signed-in connection; the "identityObject" a
// client sends with each command is never consulted.
#pragma once

#include <cstdint>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "config.h"
#include "framing.h"

namespace zelserverd {

class TokenStore;

enum Right : std::uint32_t {
    kRightJobs = 1u << 0,
    kRightRepositoryRead = 1u << 1,
    kRightRepositoryWrite = 1u << 2,
    kRightRepositoryAdmin = 1u << 3,
    kRightTokens = 1u << 4,       // the user's own token
    kRightTokensAdmin = 1u << 5,  // anyone's token
    kRightSharedRead = 1u << 6,
    kRightSharedWrite = 1u << 7,
    kRightJobsAdmin = 1u << 8,  // everyone's jobs, not only one's own
    kRightAll = (1u << 9) - 1,
};

// Passwords are kept as crypt(3) hashes ("$y$..." from hashPassword, or any other method
// libcrypt knows); a stored value not starting with '$' is a plain password, accepted for quick
// starts.
bool isPasswordHash(std::string_view stored);
// A fresh yescrypt hash of `password`; empty when libcrypt fails.
std::string hashPassword(std::string_view password);
// Whether `given` is the password `stored` (a hash or plain text) stands for.
bool passwordMatches(const std::string& stored, const std::string& given);

std::optional<std::uint32_t> rightFromName(std::string_view name);
std::optional<std::uint32_t> builtInRoleRights(std::string_view role);
std::uint32_t rightsOfRoles(const Config& config, const std::vector<std::string>& roles);

struct Principal {
    std::string user;
    std::vector<std::string> roles;
    std::uint32_t rights = 0;
    bool singleSignOn = false;
    std::string ssoAuthData;
};

struct SignInOutcome {
    std::optional<Principal> principal;
    std::string error;  // without the "Authentication Error: " prefix
};

// Failed sign-ins per account and per client address. After kFreeFailures failures in a row a
// key is locked, first for one second, doubling with each further failure up to kMaxLockSeconds;
// while either key of an attempt is locked the attempt is refused unchecked. A success clears
// both keys. At most kMaxKeys keys are kept: past that the ones whose lock ran out go first, then
// the oldest.
class SignInThrottle {
public:
    static constexpr unsigned kFreeFailures = 5;
    static constexpr std::int64_t kMaxLockSeconds = 60;
    static constexpr std::size_t kMaxKeys = 4096;

    // Seconds left on the lock of either key, 0 when the attempt may go ahead.
    std::int64_t lockedFor(const std::string& account, const std::string& address);
    void failed(const std::string& account, const std::string& address);
    void succeeded(const std::string& account, const std::string& address);

private:
    struct Entry {
        unsigned failures = 0;
        std::int64_t lockedUntil = 0;  // steady clock, milliseconds
        std::int64_t last = 0;
    };
    void fail(const std::string& key, std::int64_t now);
    void makeRoom(std::int64_t now);

    std::mutex mutex_;
    std::map<std::string, Entry> entries_;
};

class Authenticator {
public:
    Authenticator(const Config& config, TokenStore* tokens) : config_(config), tokens_(tokens) {}
    SignInOutcome signIn(const Request& request, const std::string& peerAddress);

private:
    SignInOutcome withPassword(const std::string& user, const std::string& password) const;
    SignInOutcome withToken(const std::string& token, const std::string& peerAddress) const;
    SignInOutcome withSingleSignOn(const std::string& data) const;
    Principal principalFor(const UserConfig& user) const;

    const Config& config_;
    TokenStore* tokens_;
    SignInThrottle throttle_;
};

}  // namespace zelserverd
