#include "security/ZELServerIdentity.h"

#include "api/ZELServerString.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "transport/xml_document.h"
#include "transport/xml_element.h"
#include "transport/xml_navigation.h"
#include "transport/xml_node_list.h"

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

// Appends `child`, a new element of `document` named `name`, to `parent`; null when that fails.
XmlElement* appendElement(XmlDocument& document, XmlElement& parent, const char* name)
{
    XmlElement* child = document.createElement(name);
    return child != nullptr && parent.appendChild(child) ? child : nullptr;
}

}  // namespace

void ZELServerIdentity::getId(IZELServerString& out) const { out.set(id_.data(), static_cast<unsigned>(id_.size())); }

void ZELServerIdentity::getRoles(IZELServerStringArray& out) const
{
    for (const std::string& role : roles_.items()) {
        out.append(ZELServerString(role));
    }
}

void ZELServerIdentity::readFromXml(const xercesc_3_2::DOMElement& element)
{
    // The navigation helpers work on wrappers; these live only for this reading.
    ZELServerDOMNodeList wrappers;
    if (const XmlElement* wrapped = wrappers.wrap(const_cast<xercesc::DOMElement*>(&element))) {
        readElement(*wrapped);
    }
}

void ZELServerIdentity::readElement(const XmlElement& element)
{
    getAttribute(&element, "id", id_);
    std::string flag;
    getAttribute(&element, "is_authenticated", flag);
    authenticated_ = toBooleanOrFalse(flag);
    std::string role;
    for (const XmlElement* roles : childElements(&element, "ROLES")) {
        for (const XmlElement* entry : childElements(roles, "ROLE")) {
            if (getAttribute(entry, "name", role)) {
                roles_.append(role);
            }
        }
    }
}

void ZELServerSingleSignOnIdentity::takeAuthData(IZELServerString& out)
{
    out.set(authData_.data(), static_cast<unsigned>(authData_.size()));
    authData_.clear();
}

void ZELServerSingleSignOnIdentity::readElement(const XmlElement& element)
{
    ZELServerIdentity::readElement(element);
    std::string state;
    getAttribute(&element, "state", state);
    state_ = stateOf(state);
    getAttribute(&element, "auth_data", authData_);
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
