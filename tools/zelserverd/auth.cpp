#include "auth.h"

#include <crypt.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <memory>
#include <utility>

#include "store.h"
#include "util.h"

namespace zelserverd {

namespace {

constexpr std::array<std::pair<std::string_view, std::uint32_t>, 9> kRightNames{{
    {"jobs", kRightJobs},
    {"jobs.admin", kRightJobsAdmin},
    {"repository.read", kRightRepositoryRead},
    {"repository.write", kRightRepositoryWrite},
    {"repository.admin", kRightRepositoryAdmin},
    {"tokens", kRightTokens},
    {"tokens.admin", kRightTokensAdmin},
    {"sharedresources.read", kRightSharedRead},
    {"sharedresources.write", kRightSharedWrite},
}};

constexpr std::uint32_t kViewerRights = kRightRepositoryRead | kRightSharedRead | kRightTokens;
constexpr std::uint32_t kUserRights = kViewerRights | kRightJobs | kRightSharedWrite;
constexpr std::uint32_t kAuthorRights = kUserRights | kRightRepositoryWrite;

}  // namespace

bool isPasswordHash(std::string_view stored) { return !stored.empty() && stored.front() == '$'; }

std::string hashPassword(std::string_view password)
{
    // Default cost; the random salt comes from the kernel.
    char setting[CRYPT_GENSALT_OUTPUT_SIZE];
    if (!crypt_gensalt_rn("$y$", 0, nullptr, 0, setting, sizeof setting))
        return {};
    auto data = std::make_unique<crypt_data>();
    const char* hash = crypt_r(std::string(password).c_str(), setting, data.get());
    return hash && hash[0] == '$' ? std::string(hash) : std::string();
}

bool passwordMatches(const std::string& stored, const std::string& given)
{
    if (!isPasswordHash(stored))
        return constantTimeEquals(stored, given);
    auto data = std::make_unique<crypt_data>();
    const char* hash = crypt_r(given.c_str(), stored.c_str(), data.get());
    return hash && constantTimeEquals(hash, stored);
}

std::optional<std::uint32_t> rightFromName(std::string_view name)
{
    for (const auto& [text, right] : kRightNames)
        if (text == name)
            return right;
    return std::nullopt;
}

std::optional<std::uint32_t> builtInRoleRights(std::string_view role)
{
    if (role == "admin")
        return kRightAll;
    if (role == "author")
        return kAuthorRights;
    if (role == "user")
        return kUserRights;
    if (role == "viewer")
        return kViewerRights;
    return std::nullopt;
}

std::uint32_t rightsOfRoles(const Config& config, const std::vector<std::string>& roles)
{
    std::uint32_t rights = 0;
    for (const auto& role : roles) {
        auto defined = config.roleRights.find(role);
        if (defined != config.roleRights.end()) {
            for (const auto& name : defined->second)
                rights |= rightFromName(name).value_or(0);
        } else {
            rights |= builtInRoleRights(role).value_or(0);
        }
    }
    return rights;
}

namespace {

std::int64_t steadyMs()
{
    return std::chrono::duration_cast<std::chrono::milliseconds>(std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

}  // namespace

std::int64_t SignInThrottle::lockedFor(const std::string& account, const std::string& address)
{
    std::lock_guard lock(mutex_);
    std::int64_t now = steadyMs();
    std::int64_t left = 0;
    for (const std::string& key : {"user:" + account, "address:" + address}) {
        auto it = entries_.find(key);
        if (it != entries_.end())
            left = std::max(left, it->second.lockedUntil - now);
    }
    return (left + 999) / 1000;
}

void SignInThrottle::failed(const std::string& account, const std::string& address)
{
    std::lock_guard lock(mutex_);
    std::int64_t now = steadyMs();
    if (!account.empty())
        fail("user:" + account, now);
    fail("address:" + address, now);
}

void SignInThrottle::succeeded(const std::string& account, const std::string& address)
{
    std::lock_guard lock(mutex_);
    entries_.erase("user:" + account);
    entries_.erase("address:" + address);
}

void SignInThrottle::fail(const std::string& key, std::int64_t now)
{
    if (!entries_.count(key))
        makeRoom(now);
    Entry& entry = entries_[key];
    entry.last = now;
    if (++entry.failures > kFreeFailures) {
        unsigned doublings = std::min(entry.failures - kFreeFailures - 1, 6u);
        entry.lockedUntil = now + 1000 * std::min<std::int64_t>(std::int64_t{1} << doublings, kMaxLockSeconds);
    }
}

void SignInThrottle::makeRoom(std::int64_t now)
{
    if (entries_.size() < kMaxKeys)
        return;
    std::erase_if(entries_, [&](const auto& item) { return item.second.lockedUntil <= now; });
    while (entries_.size() >= kMaxKeys)
        entries_.erase(std::min_element(entries_.begin(), entries_.end(),
                                        [](const auto& a, const auto& b) { return a.second.last < b.second.last; }));
}

SignInOutcome Authenticator::signIn(const Request& request, const std::string& peer)
{
    const std::string* user = request.find("userID");
    std::string account = user ? *user : std::string();
    if (std::int64_t left = throttle_.lockedFor(account, peer))
        return {std::nullopt, "too many failed sign-ins for this account or from this address; try again in " +
                                  std::to_string(left) + " seconds"};
    SignInOutcome outcome;
    if (const std::string* token = request.find("userToken"))
        outcome = withToken(*token, peer);
    else if (const std::string* sso = request.find("ssoAuthData"))
        outcome = withSingleSignOn(*sso);
    else if (!user || !request.find("userPassword"))
        return {std::nullopt, "no credentials were given"};
    else
        outcome = withPassword(*user, *request.find("userPassword"));
    if (outcome.principal)
        throttle_.succeeded(outcome.principal->user, peer);
    else
        throttle_.failed(account, peer);
    return outcome;
}

Principal Authenticator::principalFor(const UserConfig& user) const
{
    return Principal{user.name, user.roles, rightsOfRoles(config_, user.roles), false, {}};
}

namespace {

// A stored hash of no one's password: an unknown account costs the same slow hash as a known one.
const std::string& decoyHash()
{
    static const std::string hash = hashPassword(randomHex(16));
    return hash;
}

}  // namespace

SignInOutcome Authenticator::withPassword(const std::string& name, const std::string& password) const
{
    const UserConfig* user = config_.findUser(name);
    // Unknown user and wrong password read the same, and take as long, so neither the reply nor its
    // timing confirms account names.
    const std::string& stored = user ? user->password : decoyHash();
    if (!passwordMatches(stored, password) || !user)
        return {std::nullopt, "invalid user name or password"};
    return {principalFor(*user), {}};
}

SignInOutcome Authenticator::withToken(const std::string& token, const std::string& peer) const
{
    if (token.empty() || !tokens_)
        return {std::nullopt, "invalid user token"};
    std::optional<UserToken> found = tokens_->findByToken(token);
    if (!found)
        return {std::nullopt, "invalid user token"};
    if (found->expired(nowSeconds()))
        return {std::nullopt, "user token has expired"};
    if (!found->clientAddress.empty() && !clientAddressMatches(found->clientAddress, peer))
        return {std::nullopt, "user token is not valid from this address"};
    const UserConfig* user = config_.findUser(found->account);
    if (!user)
        return {std::nullopt, "user token belongs to an unknown account"};
    tokens_->touch(found->account);
    return {principalFor(*user), {}};
}

SignInOutcome Authenticator::withSingleSignOn(const std::string& data) const
{
    if (config_.ssoSecret.empty())
        return {std::nullopt, "single sign-on is not enabled"};
    std::size_t colon = data.find(':');
    if (colon == std::string::npos)
        return {std::nullopt, "malformed single sign-on data"};
    const UserConfig* user = config_.findUser(data.substr(0, colon));
    if (!user || !constantTimeEquals(data.substr(colon + 1), config_.ssoSecret))
        return {std::nullopt, "single sign-on data was not accepted"};
    Principal principal = principalFor(*user);
    principal.singleSignOn = true;
    principal.ssoAuthData = randomHex(16);
    return {std::move(principal), {}};
}

}  // namespace zelserverd
