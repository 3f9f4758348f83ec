// XML in and out with pugixml. Documents from clients are parsed without DTD processing, so no
// entity can expand; their size is already bounded by the request frame limit, and their depth by
// kMaxXmlDepth, so nothing that walks them can run out of stack.
#pragma once

#include <pugixml.hpp>

#include <string>
#include <string_view>

#include "auth.h"

namespace zelserverd {

// The deepest nesting of elements accepted in a client's document; the protocol's own documents
// are a handful of levels deep.
constexpr int kMaxXmlDepth = 64;

// Serialised with the declaration and no added whitespace.
std::string serializeXml(const pugi::xml_document& doc);
// Parses a value that must be a document no deeper than kMaxXmlDepth; returns an error text or
// empty.
std::string parseXml(std::string_view text, pugi::xml_document& doc);
// The first element called `name`: the node itself or any descendant, in document order.
pugi::xml_node findElement(pugi::xml_node node, std::string_view name);

// A reply document: the root element named after the command, holding what `fill` adds.
template <typename Fill>
std::string replyDocument(std::string_view root, Fill&& fill)
{
    pugi::xml_document doc;
    pugi::xml_node element = doc.append_child(std::string(root).c_str());
    fill(element);
    return serializeXml(doc);
}

// Appends the "IDENTITY" (or "SSO_IDENTITY") element that describes a signed-in principal.
void appendIdentity(pugi::xml_node parent, const Principal& principal);

}  // namespace zelserverd
