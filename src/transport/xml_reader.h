#pragma once
// XmlReader: parses one reply body held in memory into a DOM document and hands out its document
// element. The reading helpers of xml_navigation.h take it from there.
//
// The parser is hardened because replies come from the network, so that a reply of N bytes costs
// time and memory linear in N. Before the parser sees a text, one linear pass refuses it when it holds
// a document type declaration (the protocol never sends one, and it is what entity bombs and external
// entities need), an element with more than kMaxAttributes attributes (the parser's duplicate check is
// quadratic in them), or elements nested more than kMaxDepth deep. The text is read as UTF-8
// whatever it declares, so that pass sees the markup exactly as the parser does. The parser itself
// loads no external DTD, resolves no external entity (any attempt fails the parse) and has no
// validator and no grammar pool.
//
// A reader parses one document. It holds a reference to the XML library (xml_platform.h) from its
// first parse until it is destroyed; destroying it releases the document, the parser and then the
// reference.

#include <cstddef>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>

#include <xercesc/framework/MemBufInputSource.hpp>
#include <xercesc/parsers/XercesDOMParser.hpp>
#include <xercesc/sax/ErrorHandler.hpp>
#include <xercesc/sax/SAXParseException.hpp>
#include <xercesc/util/SecurityManager.hpp>
#include <xercesc/util/XMLEntityResolver.hpp>
#include <xercesc/util/XMLResourceIdentifier.hpp>
#include <zelserverapi/IZELServerStatus.h>

#include "api/heap.h"
#include "transport/xml_document.h"
#include "transport/xml_platform.h"

namespace zel {

class XmlEntityRefused : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class XmlEntityRefusal : public xercesc::XMLEntityResolver {
public:
    // Never returns: throws XmlEntityRefused naming the refused system identifier.
    xercesc::InputSource* resolveEntity(xercesc::XMLResourceIdentifier* resource) override;
};

class XmlErrorCollector : public xercesc::ErrorHandler {
public:
    void warning(const xercesc::SAXParseException& exception) override;
    void error(const xercesc::SAXParseException& exception) override;
    void fatalError(const xercesc::SAXParseException& exception) override;
    void resetErrors() override;

    bool failed() const noexcept { return failed_; }
    // The parser's message of the first error (UTF-8).
    const std::string& firstMessage() const noexcept { return message_; }

private:
    void record(const xercesc::SAXParseException& exception);

    bool failed_ = false;
    std::string message_;
};

class XmlReader : public HeapObject {
public:
    // Entity references (other than the predefined ones) one document may expand.
    static constexpr XMLSize_t kEntityExpansionLimit = 100;
    // Far above anything the server writes (an item, the widest element, has 16 attributes; the
    // deepest reply, a workspace definition, nests about 10 levels).
    static constexpr std::size_t kMaxAttributes = 64;
    static constexpr std::size_t kMaxDepth = 64;

    XmlReader() = default;
    ~XmlReader();
    XmlReader(const XmlReader&) = delete;
    XmlReader& operator=(const XmlReader&) = delete;

    // Parses `text` (read in place; it need only live during the call). Null on success, after
    // which rootOf() is the document element. Status 393620 when the XML library cannot start, when
    // the text breaks one of the limits above, or with the parser's message when the text is not a
    // well-formed UTF-8 document (an empty text included). Once a reader has
    // parsed (successfully or not) it is busy, and later calls return null without parsing.
    [[nodiscard]] IZELServerStatus* parse(std::string_view text);

    // The parsed document's element, owned by the reader; null before a successful parse.
    XmlElement* rootOf() const noexcept { return root_; }
    bool busy() const noexcept { return busy_; }

    // True while some reader holds the XML library because it parsed; cleared when the last such
    // reader is destroyed.
    static bool readerInitialisedLibrary() noexcept;

private:
    IZELServerStatus* parseText(std::string_view text);
    void releaseAll() noexcept;

    XmlPlatformRef platform_;  // first member: the library stays up until everything below is gone
    bool busy_ = false;
    bool countedAsReader_ = false;
    XmlEntityRefusal refusal_;
    XmlErrorCollector errors_;
    xercesc::SecurityManager security_;
    std::unique_ptr<xercesc::XercesDOMParser> parser_;
    std::unique_ptr<xercesc::MemBufInputSource> source_;
    ZELServerDOMNodeList elements_;
    XmlElement* root_ = nullptr;
};

}  // namespace zel
