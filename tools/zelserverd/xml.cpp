#include "xml.h"

#include <sstream>

namespace zelserverd {

std::string serializeXml(const pugi::xml_document& doc)
{
    std::ostringstream out;
    doc.save(out, "", pugi::format_raw, pugi::encoding_utf8);
    return out.str();
}

namespace {

// Finds whether a document nests deeper than kMaxXmlDepth; pugixml's traversal keeps its own
// depth count and does not recurse.
struct DepthProbe : pugi::xml_tree_walker {
    bool tooDeep = false;
    bool for_each(pugi::xml_node& node) override
    {
        tooDeep = node.type() == pugi::node_element && depth() >= kMaxXmlDepth;
        return !tooDeep;
    }
};

}  // namespace

std::string parseXml(std::string_view text, pugi::xml_document& doc)
{
    pugi::xml_parse_result result = doc.load_buffer(text.data(), text.size(), pugi::parse_default, pugi::encoding_utf8);
    if (!result)
        return std::string("malformed XML: ") + result.description();
    if (!doc.document_element())
        return "XML document has no element";
    DepthProbe probe;
    doc.traverse(probe);
    if (probe.tooDeep)
        return "XML document is nested deeper than " + std::to_string(kMaxXmlDepth) + " levels";
    return {};
}

pugi::xml_node findElement(pugi::xml_node node, std::string_view name)
{
    if (node.type() == pugi::node_element && name == node.name())
        return node;
    // Document order without recursion: whatever the depth, the stack stays flat.
    return node.find_node([&](pugi::xml_node n) { return n.type() == pugi::node_element && name == n.name(); });
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
