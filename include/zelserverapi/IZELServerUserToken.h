#pragma once
// A stored user token ("USERTOKEN"): lets a user's later connections sign in without a password. Made
// by IZELServerSecurityManager::createUserToken and destroyed by
// IZELServerSecurityManager::destroyUserToken. The token's dates are kept as the server's text and
// sent back unchanged; they have no getters.

#include "IZELServerString.h"

class IZELServerUserToken {
public:
    virtual void getToken(IZELServerString& out) const = 0;
    virtual void getClientAddress(IZELServerString& out) const = 0;
    // As the server counts it; 0 when the server's text was not a number.
    virtual long long getExpirationTimeout() const = 0;
    virtual ~IZELServerUserToken() = default;

protected:
    IZELServerUserToken() = default;
    IZELServerUserToken(const IZELServerUserToken&) = default;
    IZELServerUserToken& operator=(const IZELServerUserToken&) = default;
};
