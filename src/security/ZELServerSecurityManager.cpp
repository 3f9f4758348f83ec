#include "security/ZELServerSecurityManager.h"

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "security/ZELServerUserToken.h"
#include "transport/command.h"

namespace zel {
namespace {

constexpr const char* kAccountName = "userAccountName";
constexpr const char* kTokenObject = "userTokenObject";

}  // namespace

IZELServerStatus* ZELServerSecurityManager::askFlag(const char* keyword, const IZELServerString& accountName,
                                                    bool& flag)
{
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected);
    }
    Command command(*channel_, keyword);
    command.add(kAccountName, accountName);
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    // The reader leaves its flag alone when the body is no boolean, so a reply the library cannot
    // read keeps the caller's value, as a failed exchange does.
    unsigned answer = flag ? 1 : 0;
    command.response().readBoolean(answer);
    flag = answer != 0;
    return nullptr;
}

IZELServerStatus* ZELServerSecurityManager::sendToken(const char* keyword, const IZELServerString& accountName,
                                                      const IZELServerUserToken& token)
{
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected);
    }
    Command command(*channel_, keyword);
    command.add(kAccountName, accountName);
    if (command.ready()) {
        // A token that cannot be written goes out without it; the server then refuses the command
        // and says why, which tells the caller more than a local XML failure would.
        command.request().addUserTokenPayload(kTokenObject, token);
    }
    return command.send();
}

IZELServerStatus* ZELServerSecurityManager::userTokenExists(const IZELServerString& accountName, bool& exists)
{
    return askFlag("SEC_USERTOKEN_EXISTS", accountName, exists);
}

IZELServerUserToken* ZELServerSecurityManager::createUserToken(const IZELServerString& token,
                                                               const IZELServerString& clientAddress,
                                                               long long expirationTimeout)
{
    return new ZELServerUserToken(toStdString(token), toStdString(clientAddress), expirationTimeout);
}

IZELServerUserToken* ZELServerSecurityManager::createUserToken() { return new ZELServerUserToken(); }

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
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected);
    }
    Command command(*channel_, "SEC_GET_USERTOKEN");
    command.add(kAccountName, accountName);
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    // An account without a token is answered with a document that holds none: that is an answer,
    // not a failure, whatever the reader says about it.
    found = command.response().readUserToken(token) == 0;
    return nullptr;
}

IZELServerStatus* ZELServerSecurityManager::addUserToken(const IZELServerString& accountName,
                                                         const IZELServerUserToken& token)
{
    return sendToken("SEC_ADD_USERTOKEN", accountName, token);
}

IZELServerStatus* ZELServerSecurityManager::updateUserToken(const IZELServerString& accountName,
                                                            const IZELServerUserToken& token)
{
    return sendToken("SEC_UPDATE_USERTOKEN", accountName, token);
}

IZELServerStatus* ZELServerSecurityManager::removeUserToken(const IZELServerString& accountName, bool& removed)
{
    return askFlag("SEC_REMOVE_USERTOKEN", accountName, removed);
}

IZELServerStatus* ZELServerSecurityManager::userTokenExpired(const IZELServerString& accountName, bool& expired)
{
    return askFlag("SEC_USERTOKEN_EXPIRED", accountName, expired);
}

}  // namespace zel
