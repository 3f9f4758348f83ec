#pragma once
// The security manager: the "SEC_" user-token commands over the session's channel, and the factory
// of the token objects they take and fill.

#include <string>

#include <zelserverapi/IZELServerSecurityManager.h>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"
#include "transport/checked_command.h"

namespace zel {

class ZELServerSecurityManager final : public IZELServerSecurityManager, public HeapObject {
public:
    // `channel` is borrowed (the session owns it) and is never touched by the destructor. A manager
    // without a channel answers every command with 393622.
    explicit ZELServerSecurityManager(IZELServerChannel* channel) : channel_(channel) {}
    ~ZELServerSecurityManager() override = default;

    IZELServerStatus* userTokenExists(const IZELServerString& accountName, bool& exists) override;
    IZELServerUserToken* createUserToken(const IZELServerString& token, const IZELServerString& clientAddress,
                                         long long expirationTimeout) override;
    IZELServerUserToken* createUserToken() override;
    void destroyUserToken(IZELServerUserToken** token) override;
    IZELServerStatus* getUserToken(const IZELServerString& accountName, IZELServerUserToken& token,
                                   bool& found) override;
    IZELServerStatus* addUserToken(const IZELServerString& accountName, const IZELServerUserToken& token) override;
    IZELServerStatus* updateUserToken(const IZELServerString& accountName, const IZELServerUserToken& token) override;
    IZELServerStatus* removeUserToken(const IZELServerString& accountName, bool& removed) override;
    IZELServerStatus* userTokenExpired(const IZELServerString& accountName, bool& expired) override;

private:
    // A command of this manager: `keyword` with "userAccountName" as its first value.
    CheckedCommand on(const char* keyword, const IZELServerString& accountName, Where where = Where::current()) const;
    // The commands whose answer is the body "true" or "false".
    IZELServerStatus* askFlag(const char* keyword, const IZELServerString& accountName, bool& flag);

    IZELServerChannel* channel_;
};

}  // namespace zel
