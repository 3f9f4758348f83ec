#include "security/ZELServerIdentity.h"

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "transport/attribute_binding.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

unsigned stateOf(const std::string& text)
{
    if (text == "SUCCEEDED") {
        return kSingleSignOnSucceeded;
    }
    if (text == "IN_PROGRESS") {
        return kSingleSignOnInProgress;
    }
    return kSingleSignOnOther;
}

constexpr AttributeBinding<IdentityFields> kIdentityAttributes[] = {
    {"id", &IdentityFields::id},
    {"is_authenticated", &IdentityFields::authenticated},
};

constexpr AttributeBinding<SingleSignOnFields> kSingleSignOnAttributes[] = {
    {"state", +[](const std::string& text, SingleSignOnFields& fields) { fields.state = stateOf(text); }},
    {"auth_data", &SingleSignOnFields::authData},
};

// Appends `child`, a new element of `document` named `name`, to `parent`; null when that fails.
XmlElement* appendElement(XmlDocument& document, XmlElement& parent, const char* name)
{
    XmlElement* child = document.createElement(name);
    return child != nullptr && parent.appendChild(child) ? child : nullptr;
}

std::optional<std::string> writeDocument(const IZELServerIdentity& identity, const std::string& rootName)
{
    XmlDocument document;
    if (IZELServerStatus* failure = document.startXml()) {
        delete failure;
        return std::nullopt;
    }
    if (document.createDocument("", rootName) == nullptr || IdentityXml(identity).writeXml(document) != 0) {
        return std::nullopt;
    }
    std::string text;
    if (IZELServerStatus* failure = document.serialize(text)) {
        delete failure;
        return std::nullopt;
    }
    return text;
}

}  // namespace

void ZELServerIdentity::getId(IZELServerString& out) const { handOutText(fields_.id, out); }

void ZELServerIdentity::getRoles(IZELServerStringArray& out) const
{
    guarded([&] {
        for (const std::string& role : roles_.items()) {
            out.append(ZELServerString(role));
        }
    });
}

void ZELServerIdentity::readFromXml(const xercesc_3_2::DOMElement& element)
{
    guarded([&] {
        // The navigation helpers work on wrappers; these live only for this reading.
        ZELServerDOMNodeList wrappers;
        if (const XmlElement* wrapped = wrappers.wrap(const_cast<xercesc::DOMElement*>(&element))) {
            readElement(*wrapped);
        }
    });
}

void ZELServerIdentity::readElement(const XmlElement& element)
{
    documents_.clear();
    readAttributes(element, fields_, kIdentityAttributes);
    std::string role;
    for (const XmlElement* roles : childElements(&element, "ROLES")) {
        for (const XmlElement* entry : childElements(roles, "ROLE")) {
            if (getAttribute(entry, "name", role)) {
                roles_.append(role);
            }
        }
    }
}

const std::string* ZELServerIdentity::documentFor(const std::string& rootName) const
{
    auto found = documents_.find(rootName);
    if (found == documents_.end()) {
        found = documents_.emplace(rootName, writeDocument(*this, rootName)).first;
    }
    return found->second ? &*found->second : nullptr;
}

void ZELServerSingleSignOnIdentity::takeAuthData(IZELServerString& out)
{
    guarded([&] {
        copyText(signOn_.authData, out);
        signOn_.authData.clear();
    });
}

void ZELServerSingleSignOnIdentity::readElement(const XmlElement& element)
{
    ZELServerIdentity::readElement(element);
    readAttributes(element, signOn_, kSingleSignOnAttributes);
}

unsigned IdentityXml::writeXml(XmlDocument& document) const
{
    ZELServerString id;
    identity_.getId(id);
    ZELServerStringArray roles;
    identity_.getRoles(roles);

    XmlElement* root = document.documentElement();
    XmlElement* identity = root != nullptr ? appendElement(document, *root, "IDENTITY") : nullptr;
    if (identity == nullptr || !identity->setAttribute("id", id.view()) ||
        !identity->setAttribute("is_authenticated", booleanText(identity_.isAuthenticated()))) {
        return msg::kXmlFailure;
    }
    XmlElement* roleList = appendElement(document, *identity, "ROLES");
    if (roleList == nullptr) {
        return msg::kXmlFailure;
    }
    for (const std::string& name : roles.items()) {
        XmlElement* role = appendElement(document, *roleList, "ROLE");
        if (role == nullptr || !role->setAttribute("name", name)) {
            return msg::kXmlFailure;
        }
    }
    return 0;
}

}  // namespace zel
