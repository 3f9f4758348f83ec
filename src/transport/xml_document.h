#pragma once
// XmlDocument: builds one XML document at a time and serialises it into a byte string. Every
// request payload (identity, job parameters, repositories, services, tokens, paths) is built here.
//
// Use: startXml() once, then createDocument(), createElement() / XmlElement operations, serialize(),
// releaseDocument() (or just destroy the object). The element handles handed out are owned by the
// document and die when the DOM document is released.
//
// The object holds its own reference to the XML library (xml_platform.h) from startXml() until it is
// destroyed.

#include <string>
#include <string_view>

#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/dom/DOMImplementation.hpp>
#include <zelserverapi/IZELServerStatus.h>

#include "api/heap.h"
#include "transport/xml_element.h"
#include "transport/xml_node_list.h"
#include "transport/xml_platform.h"

namespace zel {

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
