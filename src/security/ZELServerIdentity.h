#pragma once
// The signed-in identity the server reports at sign-in, its single sign-on kind, and the writer
// that attaches an identity to every request.

#include <map>
#include <optional>
#include <string>

#include <zelserverapi/IZELServerIdentity.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>

#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "transport/IZELServerRequest.h"

namespace zel {

class XmlElement;

struct IdentityFields {
    std::string id;
    bool authenticated = false;
};

struct SingleSignOnFields {
    unsigned state;
    std::string authData;
};

// Single sign-on states.
inline constexpr unsigned kSingleSignOnSucceeded = 0;
inline constexpr unsigned kSingleSignOnInProgress = 1;
inline constexpr unsigned kSingleSignOnOther = 2;

// An identity read from an "IDENTITY" element: "id", "is_authenticated" and the "name" of every
// "ROLE" inside every "ROLES" child. Empty and not authenticated until read.
class ZELServerIdentity : public IZELServerIdentity, public HeapObject {
public:
    ZELServerIdentity() = default;
    ~ZELServerIdentity() override = default;
    ZELServerIdentity(const ZELServerIdentity&) = delete;
    ZELServerIdentity& operator=(const ZELServerIdentity&) = delete;

    void getId(IZELServerString& out) const override;
    void getRoles(IZELServerStringArray& out) const override;
    bool isAuthenticated() const override { return fields_.authenticated; }
    // Replaces the id and the flag; appends the roles to those already held (reading twice doubles
    // them). Element and attribute names are matched as the server writes them: "ROLES" and
    // "ROLE" ignoring case, attributes exactly. The XML library must be up, as it is while the
    // element's document exists.
    void readFromXml(const xercesc_3_2::DOMElement& element) override;

    // The identity as every request carries it: a document whose root element is named `rootName`
    // holding the identity's element (see IdentityXml). Written once per root name and kept until
    // the identity is read again, since it changes only at sign-in. Null when it cannot be written
    // (the root name is no XML name, the XML library is not available).
    const std::string* documentFor(const std::string& rootName) const;

protected:
    // Reads the element's fields; the single sign-on kind reads its own after these.
    virtual void readElement(const XmlElement& element);

private:
    IdentityFields fields_;
    ZELServerStringArray roles_;
    // Written documents by root name; a failed one is remembered as such.
    mutable std::map<std::string, std::optional<std::string>, std::less<>> documents_;
};

// The identity of a single sign-on reply ("SSO_IDENTITY"): the identity's fields plus "state"
// (exactly "SUCCEEDED" 0, exactly "IN_PROGRESS" 1, anything else or absent 2) and "auth_data".
class ZELServerSingleSignOnIdentity final : public ZELServerIdentity, public IZELServerSingleSignOnIdentity {
public:
    ZELServerSingleSignOnIdentity() = default;
    ~ZELServerSingleSignOnIdentity() override = default;

    unsigned getState() const override { return signOn_.state; }
    void takeAuthData(IZELServerString& out) override;

protected:
    void readElement(const XmlElement& element) override;

private:
    SingleSignOnFields signOn_{kSingleSignOnOther, {}};
};

// Writes an identity below a document's root element as the server expects it on every request:
// "IDENTITY" with "id", "is_authenticated" ("true"/"false") and a "ROLES" element holding one
// "ROLE" (attribute "name") per role; "ROLES" is written even when there are no roles. A single
// sign-on identity is written the same way, without its state and authentication data.
// writeXml returns 0, or 393620 when an element cannot be made or a text is not valid UTF-8.
class IdentityXml final : public XmlWritable {
public:
    explicit IdentityXml(const IZELServerIdentity& identity) : identity_(identity) {}
    unsigned writeXml(XmlDocument& document) const override;

private:
    const IZELServerIdentity& identity_;
};

}  // namespace zel
