#pragma once
// Manages the server's stored user tokens, one per user account: whether one exists or has expired,
// and fetching, adding, updating and removing it. Owned by the session
// (IZELServerSession::getSecurityManager); never destroy it yourself. It is also the factory of the
// token objects it takes and fills.
//
// Every command is one exchange with the server and returns null on success or a status that the
// caller destroys with IZELServerSession::destroyStatus; the connection's statuses come back unchanged.
// Out flags are written only when the exchange succeeds: on failure they keep the caller's value.

#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerUserToken.h"

class IZELServerSecurityManager {
public:
    virtual IZELServerStatus* userTokenExists(const IZELServerString& accountName, bool& exists) = 0;

    // A new token with empty dates; null when memory is exhausted. Destroy it with destroyUserToken.
    virtual IZELServerUserToken* createUserToken(const IZELServerString& token, const IZELServerString& clientAddress,
                                                 long long expirationTimeout) = 0;
    // A new empty token (timeout 0); null when memory is exhausted.
    virtual IZELServerUserToken* createUserToken() = 0;
    // Destroys the token when `*token` is not null; always stores null.
    virtual void destroyUserToken(IZELServerUserToken** token) = 0;

    // Fills `token` from the server's answer; `found` is false, and `token` untouched, when the answer
    // holds no token (which is no failure).
    virtual IZELServerStatus* getUserToken(const IZELServerString& accountName, IZELServerUserToken& token,
                                           bool& found) = 0;
    virtual IZELServerStatus* addUserToken(const IZELServerString& accountName, const IZELServerUserToken& token) = 0;
    virtual IZELServerStatus* updateUserToken(const IZELServerString& accountName,
                                              const IZELServerUserToken& token) = 0;
    // `removed` is the server's answer.
    virtual IZELServerStatus* removeUserToken(const IZELServerString& accountName, bool& removed) = 0;
    virtual IZELServerStatus* userTokenExpired(const IZELServerString& accountName, bool& expired) = 0;

    virtual ~IZELServerSecurityManager() = default;

protected:
    IZELServerSecurityManager() = default;
    IZELServerSecurityManager(const IZELServerSecurityManager&) = delete;
    IZELServerSecurityManager& operator=(const IZELServerSecurityManager&) = delete;
};
