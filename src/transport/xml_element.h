#pragma once
// XmlElement: a non-owning handle to one DOM element. Handles are made and owned by the
// ZELServerDOMNodeList of the element's XmlDocument or XmlReader and are valid while it lives.
// Names and values are UTF-8 byte strings.

#include <string>
#include <string_view>

#include <xercesc/dom/DOMElement.hpp>

#include "api/heap.h"

namespace zel {

class ZELServerDOMNodeList;

class XmlElement : public HeapObject {
public:
    XmlElement(const XmlElement&) = delete;
    XmlElement& operator=(const XmlElement&) = delete;

    xercesc::DOMElement* node() const noexcept { return node_; }
    // The list that owns this handle; handles of related elements (children, descendants) go there.
    ZELServerDOMNodeList& owner() const noexcept { return *owner_; }

    // The tag name as written.
    std::string name() const;

    // Sets (or replaces) an attribute. False, with the element unchanged, when the name is not a
    // legal XML name or either text is not valid UTF-8 or holds a NUL.
    bool setAttribute(std::string_view name, std::string_view value);
    // Same with a value in the local single-byte encoding (Latin-1), converted to UTF-8 first.
    bool setAttributeLocal(std::string_view name, std::string_view localValue);
    // Appends `child` as the last child. A null child is ignored (false), as is a child of another
    // document or one that would make a cycle.
    bool appendChild(XmlElement* child);
    // Appends a text node. False when the text is not valid UTF-8 or holds a NUL.
    bool appendText(std::string_view text);

private:
    friend class ZELServerDOMNodeList;
    XmlElement(xercesc::DOMElement* node, ZELServerDOMNodeList& owner) noexcept : node_(node), owner_(&owner) {}

    xercesc::DOMElement* node_;
    ZELServerDOMNodeList* owner_;
};

}  // namespace zel
