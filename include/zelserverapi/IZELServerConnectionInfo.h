#pragma once
// Where the server is and how to sign in. Made by one of the session's createConnectionInfo forms,
// read-only afterwards, and destroyed by IZELServerSession::destroyConnectionInfo.
//
// Connection kind: 0 for the host-and-port forms, 1 for the web-address forms (a session refuses
// kind 1 with status 393639). Authentication kind: 0 user name and password; 1 user token (the
// properties hold "USER_TOKEN" and not "SSO_AUTH_DATA"); 2 single sign-on (the properties hold
// "SSO_AUTH_DATA"); 3 other properties. Properties the session reads: "CLIENT_ID",
// "TRUSTED_HOST_NAMES", "SSO_AUTH_DATA", "USER_TOKEN", and the limits below.
//
// Limits, read at every IZELServerSession::init (seconds are decimal with at most three decimals;
// 0 means no limit; a value that does not convert makes init fail with 393617 naming it):
//   "CONNECT_TIMEOUT"      seconds to wait for the TCP connection (default 30); then 393601
//   "IO_TIMEOUT"           seconds each single send or receive may wait (default: no limit); then
//                          393607 or 393608
//   "RESULT_PORT_TIMEOUT"  seconds a transacted job waits for the server to call back with its
//                          result (default: no limit); then 393618
//   "MAX_REPLY_BYTES"      the largest frame accepted from the server, 1 to 4294967295 bytes
//                          (default 67108864, enough for a list of about 300,000 entries); a larger
//                          one is refused with 393604 before its content is read
// Whatever the properties say, an XML reply is refused with 393620 before it is parsed when it has a
// document type declaration, an element with more than 64 attributes, or elements nested more than
// 64 deep.
// A time-out gives the status of the step that waited with getCode() 392012. After a time-out in
// the middle of an exchange, or a refused frame, the connection is given up: later commands return
// 393622 until init connects again.
//
// The session's createConnectionInfo forms with a user name and password take no properties: a
// client that signs in that way and wants limits implements this interface itself (for example
// delegating to the object the session made and adding the properties); init takes any
// implementation.

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
