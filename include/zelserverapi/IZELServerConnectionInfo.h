#pragma once
// Where the server is and how to sign in. Made by one of the session's createConnectionInfo forms,
// read-only afterwards, and destroyed by IZELServerSession::destroyConnectionInfo.
//
// Connection kind: 0 for the host-and-port forms, 1 for the web-address forms (a session refuses
// kind 1 with status 393639). Authentication kind: 0 user name and password; 1 user token (the
// properties hold "USER_TOKEN" and not "SSO_AUTH_DATA"); 2 single sign-on (the properties hold
// "SSO_AUTH_DATA"); 3 other properties. Properties the session reads: "CLIENT_ID",
// "TRUSTED_HOST_NAMES", "SSO_AUTH_DATA", "USER_TOKEN".

#include "IZELServerString.h"

class IZELServerConnectionInfo {
public:
    virtual void getHost(IZELServerString& out) const = 0;
    virtual unsigned short getPort() const = 0;
    virtual void getUserName(IZELServerString& out) const = 0;
    virtual void getPassword(IZELServerString& out) const = 0;
    virtual unsigned getConnectionKind() const = 0;
    // The web address as given; empty for the host-and-port forms.
    virtual void getAddress(IZELServerString& out) const = 0;
    // Always empty.
    virtual void getAuxiliaryText(IZELServerString& out) const = 0;
    virtual unsigned getAuthenticationKind() const = 0;
    // True and the value written when the key (compared exactly) is present; false, `out` untouched, otherwise.
    virtual bool getProperty(const IZELServerString& key, IZELServerString& out) const = 0;
    virtual ~IZELServerConnectionInfo() = default;

protected:
    IZELServerConnectionInfo() = default;
    IZELServerConnectionInfo(const IZELServerConnectionInfo&) = default;
    IZELServerConnectionInfo& operator=(const IZELServerConnectionInfo&) = default;
};
