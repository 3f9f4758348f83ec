#pragma once
// The DOM side both directions share and the writer: XmlElement, a non-owning handle to one DOM
// element; ZELServerDOMNodeList, the owning list of the handles given out for one document; and
// XmlDocument, which builds one document at a time and serialises it into a byte string (every
// request payload is built here). Names and values are UTF-8 byte strings.

#include <cstddef>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/dom/DOMElement.hpp>
#include <xercesc/dom/DOMImplementation.hpp>
#include <zelserverapi/IZELServerStatus.h>

#include "api/heap.h"
#include "transport/xml_platform.h"

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

class XmlElement;

class ZELServerDOMNodeList : public HeapObject {
public:
    ZELServerDOMNodeList() = default;
    // Slot 0: clears, then frees the list.
    virtual ~ZELServerDOMNodeList();
    // Slot 1: deletes the wrappers, last first, until the list is empty.
    virtual void clear() noexcept;

    ZELServerDOMNodeList(const ZELServerDOMNodeList&) = delete;
    ZELServerDOMNodeList& operator=(const ZELServerDOMNodeList&) = delete;

    // The wrapper of `node`, owned by this list; a node wrapped before gets the same wrapper again.
    // Null for a null node, or when the library's heap is exhausted (and its routine returned); memory
    // running out elsewhere throws std::bad_alloc, so that no element of a reply is silently left out.
    XmlElement* wrap(xercesc::DOMElement* node);

    std::size_t size() const noexcept { return wrappers_.size(); }

private:
    std::vector<XmlElement*> wrappers_;
    // Walking a large reply more than once must not multiply the wrappers.
    std::unordered_map<const xercesc::DOMElement*, XmlElement*> byNode_;
};

class XmlDocument : public HeapObject {
public:
    XmlDocument() = default;
    // Releases the current document, then the reference to the XML library.
    ~XmlDocument();
    XmlDocument(const XmlDocument&) = delete;
    XmlDocument& operator=(const XmlDocument&) = delete;

    // Starts the XML library and looks up its "Core" DOM implementation. Null on success; status
    // 393620 with the library's message when it cannot start, or with "Requested DOM implementation
    // is not supported". Calling it again after success does nothing more.
    [[nodiscard]] IZELServerStatus* startXml();
    bool started() const noexcept { return implementation_ != nullptr; }

    // Makes a new current document whose document element is `rootName` (no document type), releasing
    // any earlier one. An empty namespace means none. Returns the document element, or null when
    // startXml() has not succeeded or the name is not a legal XML name.
    XmlElement* createDocument(std::string_view namespaceUri, std::string_view rootName);
    // A new element of the current document, not yet attached anywhere. Null without a current
    // document or for an illegal name.
    XmlElement* createElement(std::string_view name);
    // The document element of the current document (the same handle on every call); null without one.
    XmlElement* documentElement();

    // Writes the current document into `out` (replacing its content): the XML declaration the
    // library writes (UTF-8) followed by the elements, with no line breaks added and no byte-order
    // mark. Null on success; status 393630 with the library's message when writing fails (for
    // example an illegal character in a value) or when there is no current document, leaving `out`
    // unchanged.
    [[nodiscard]] IZELServerStatus* serialize(std::string& out) const;

    // Releases the current DOM document and every element handle of it.
    void releaseDocument() noexcept;

private:
    XmlPlatformRef platform_;  // first member: the library stays up until everything below is gone
    xercesc::DOMImplementation* implementation_ = nullptr;
    xercesc::DOMDocument* document_ = nullptr;
    ZELServerDOMNodeList elements_;
    XmlElement* root_ = nullptr;
};

}  // namespace zel
