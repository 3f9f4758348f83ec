#include "xml.h"

#include <sstream>

namespace zelserverd {

std::string serializeXml(const pugi::xml_document& doc)
{
    std::ostringstream out;
    doc.save(out, "", pugi::format_raw, pugi::encoding_utf8);
    return out.str();
}

std::string parseXml(std::string_view text, pugi::xml_document& doc)
{
    pugi::xml_parse_result result = doc.load_buffer(text.data(), text.size(), pugi::parse_default, pugi::encoding_utf8);
    if (!result)
        return std::string("malformed XML: ") + result.description();
    if (!doc.document_element())
        return "XML document has no element";
    return {};
}

pugi::xml_node findElement(pugi::xml_node node, std::string_view name)
{
    if (node.type() == pugi::node_element && name == node.name())
        return node;
    for (pugi::xml_node child = node.first_child(); child; child = child.next_sibling()) {
        pugi::xml_node found = findElement(child, name);
        if (found)
            return found;
    }
    return {};
}

void appendIdentity(pugi::xml_node parent, const Principal& principal)
{
    pugi::xml_node identity = parent.append_child(principal.singleSignOn ? "SSO_IDENTITY" : "IDENTITY");
    identity.append_attribute("id") = principal.user.c_str();
    identity.append_attribute("is_authenticated") = "true";
    if (principal.singleSignOn) {
        identity.append_attribute("state") = "SUCCEEDED";
        identity.append_attribute("auth_data") = principal.ssoAuthData.c_str();
    }
    pugi::xml_node roles = identity.append_child("ROLES");
    for (const auto& role : principal.roles)
        roles.append_child("ROLE").append_attribute("name") = role.c_str();
}

}  // namespace zelserverd
