#pragma once
// Who the server says the signed-in user is. Owned by the session's channel and lent out by
// IZELServerSession::getIdentity: never destroy it yourself.

#include "IZELServerString.h"
#include "IZELServerStringArray.h"

namespace xercesc_3_2 {
class DOMElement;
}

class IZELServerIdentity {
public:
    virtual void getId(IZELServerString& out) const = 0;
    // Appends the role names, in the server's order, to `out` (which is not cleared first).
    virtual void getRoles(IZELServerStringArray& out) const = 0;
    virtual bool isAuthenticated() const = 0;
    virtual ~IZELServerIdentity() = default;
    // Fills the identity from its XML element; used by the library when it reads a sign-in reply.
    virtual void readFromXml(const xercesc_3_2::DOMElement& element) = 0;

protected:
    IZELServerIdentity() = default;
    IZELServerIdentity(const IZELServerIdentity&) = default;
    IZELServerIdentity& operator=(const IZELServerIdentity&) = default;
};

// The identity of a single sign-on exchange: the same identity, plus the progress of the exchange
// and the authentication data the client must pass on.
class IZELServerSingleSignOnIdentity {
public:
    // 0 succeeded, 1 in progress, 2 anything else.
    virtual unsigned getState() const = 0;
    // Writes the authentication data into `out` and forgets it: a second call yields "".
    virtual void takeAuthData(IZELServerString& out) = 0;
    virtual ~IZELServerSingleSignOnIdentity() = default;

protected:
    IZELServerSingleSignOnIdentity() = default;
    IZELServerSingleSignOnIdentity(const IZELServerSingleSignOnIdentity&) = default;
    IZELServerSingleSignOnIdentity& operator=(const IZELServerSingleSignOnIdentity&) = default;
};
