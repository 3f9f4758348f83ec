#include "security/ZELServerSecurityManager.h"

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "security/ZELServerUserToken.h"
#include "transport/checked_command.h"

namespace zel {
namespace {

constexpr const char* kAccountName = "userAccountName";
constexpr const char* kTokenObject = "userTokenObject";

// The security manager's flags are truth values, the command path's are unsigned. Every flag of
// this manager keeps the caller's value when the command fails or its reply does not say: a caller
// asking about a token learns nothing from a failed question, and its own value tells it so.
template <typename Ask>
IZELServerStatus* askTruth(bool& flag, Ask ask)
{
    unsigned answer = flag ? 1 : 0;
    IZELServerStatus* status = ask(answer);
    flag = answer != 0;
    return status;
}

}  // namespace

CheckedCommand ZELServerSecurityManager::on(const char* keyword, const IZELServerString& accountName, Where where) const
{
    CheckedCommand command(channel_, keyword, where);
    command.add(kAccountName, accountName);
    return command;
}

IZELServerStatus* ZELServerSecurityManager::askFlag(const char* keyword, const IZELServerString& accountName,
                                                    bool& flag)
{
    return askTruth(flag, [&](unsigned& answer) { return on(keyword, accountName).askFlag(answer, OnFailure::kKeep); });
}

IZELServerStatus* ZELServerSecurityManager::userTokenExists(const IZELServerString& accountName, bool& exists)
{
    return guarded([&] { return askFlag("SEC_USERTOKEN_EXISTS", accountName, exists); });
}

IZELServerUserToken* ZELServerSecurityManager::createUserToken(const IZELServerString& token,
                                                               const IZELServerString& clientAddress,
                                                               long long expirationTimeout)
{
    return guarded(
        [&] { return new ZELServerUserToken(toStdString(token), toStdString(clientAddress), expirationTimeout); });
}

IZELServerUserToken* ZELServerSecurityManager::createUserToken()
{
    return guarded([&] { return new ZELServerUserToken(); });
}

void ZELServerSecurityManager::destroyUserToken(IZELServerUserToken** token)
{
    if (token == nullptr) {
        return;
    }
    delete *token;
    *token = nullptr;
}

IZELServerStatus* ZELServerSecurityManager::getUserToken(const IZELServerString& accountName,
                                                         IZELServerUserToken& token, bool& found)
{
    return guarded([&]() -> IZELServerStatus* {
        // An account without a token is answered with a document that holds none: that is an answer,
        // not a failure, whatever the reader says about it.
        return askTruth(found, [&](unsigned& answer) {
            return on("SEC_GET_USERTOKEN", accountName)
                .askObject(
                    answer, [&token](const IZELServerResponse& response) { return response.readUserToken(token); },
                    OnFailure::kKeep);
        });
    });
}

IZELServerStatus* ZELServerSecurityManager::addUserToken(const IZELServerString& accountName,
                                                         const IZELServerUserToken& token)
{
    return guarded([&] { return on("SEC_ADD_USERTOKEN", accountName).addUserToken(kTokenObject, token).send(); });
}

IZELServerStatus* ZELServerSecurityManager::updateUserToken(const IZELServerString& accountName,
                                                            const IZELServerUserToken& token)
{
    return guarded([&] { return on("SEC_UPDATE_USERTOKEN", accountName).addUserToken(kTokenObject, token).send(); });
}

IZELServerStatus* ZELServerSecurityManager::removeUserToken(const IZELServerString& accountName, bool& removed)
{
    return guarded([&] { return askFlag("SEC_REMOVE_USERTOKEN", accountName, removed); });
}

IZELServerStatus* ZELServerSecurityManager::userTokenExpired(const IZELServerString& accountName, bool& expired)
{
    return guarded([&] { return askFlag("SEC_USERTOKEN_EXPIRED", accountName, expired); });
}

}  // namespace zel
