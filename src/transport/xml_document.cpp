#include "transport/xml_document.h"

#include <memory>
#include <new>

#include <xercesc/dom/DOMConfiguration.hpp>
#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/dom/DOMImplementationLS.hpp>
#include <xercesc/dom/DOMImplementationRegistry.hpp>
#include <xercesc/dom/DOMLSOutput.hpp>
#include <xercesc/dom/DOMLSSerializer.hpp>
#include <xercesc/dom/DOMText.hpp>
#include <xercesc/framework/MemBufFormatTarget.hpp>
#include <xercesc/util/XMLUni.hpp>

#include "api/message_numbers.h"
#include "api/status.h"
#include "api/text_encoding.h"
#include "transport/xml_platform.h"
#include "transport/xml_transcode.h"

namespace zel {

std::string XmlElement::name() const { return toUtf8(node_->getTagName()); }

bool XmlElement::setAttribute(std::string_view name, std::string_view value)
{
    const XmlText xmlName(name);
    const XmlText xmlValue(value);
    if (!xmlName.valid() || !xmlValue.valid()) {
        return false;
    }
    try {
        node_->setAttribute(xmlName.get(), xmlValue.get());
        return true;
    } catch (...) {  // a DOM exception for an illegal name
        rethrowIfOutOfMemory();
        return false;
    }
}

bool XmlElement::setAttributeLocal(std::string_view name, std::string_view localValue)
{
    return setAttribute(name, latin1ToUtf8(localValue));
}

bool XmlElement::appendChild(XmlElement* child)
{
    if (child == nullptr) {
        return false;
    }
    try {
        node_->appendChild(child->node_);
        return true;
    } catch (...) {  // wrong document, or the child is an ancestor
        rethrowIfOutOfMemory();
        return false;
    }
}

bool XmlElement::appendText(std::string_view text)
{
    const XmlText xmlText(text);
    if (!xmlText.valid()) {
        return false;
    }
    try {
        node_->appendChild(node_->getOwnerDocument()->createTextNode(xmlText.get()));
        return true;
    } catch (...) {
        rethrowIfOutOfMemory();
        return false;
    }
}

ZELServerDOMNodeList::~ZELServerDOMNodeList() { clear(); }

void ZELServerDOMNodeList::clear() noexcept
{
    while (!wrappers_.empty()) {
        delete wrappers_.back();
        wrappers_.pop_back();
    }
    byNode_.clear();
}

XmlElement* ZELServerDOMNodeList::wrap(xercesc::DOMElement* node)
{
    if (node == nullptr) {
        return nullptr;
    }
    if (auto found = byNode_.find(node); found != byNode_.end()) {
        return found->second;
    }
    std::unique_ptr<XmlElement> wrapper(new XmlElement(node, *this));
    if (!wrapper) {
        return nullptr;
    }
    wrappers_.push_back(wrapper.get());
    XmlElement* kept = wrapper.release();
    byNode_.emplace(node, kept);
    return kept;
}

namespace {

constexpr XMLCh kCoreFeature[] = {'C', 'o', 'r', 'e', 0};
constexpr XMLCh kLsFeature[] = {'L', 'S', 0};
constexpr const char* kNotSupported = "Requested DOM implementation is not supported";
// Enough for the identity document of most requests without the target growing.
constexpr XMLSize_t kInitialTargetCapacity = 1023;

struct ReleaseDom {
    template <class T>
    void operator()(T* object) const noexcept
    {
        object->release();
    }
};
using SerializerPtr = std::unique_ptr<xercesc::DOMLSSerializer, ReleaseDom>;
using OutputPtr = std::unique_ptr<xercesc::DOMLSOutput, ReleaseDom>;

void setIfSupported(xercesc::DOMConfiguration& config, const XMLCh* parameter, bool value)
{
    if (config.canSetParameter(parameter, value)) {
        config.setParameter(parameter, value);
    }
}

}  // namespace

XmlDocument::~XmlDocument() { releaseDocument(); }

IZELServerStatus* XmlDocument::startXml()
{
    if (started()) {
        return nullptr;
    }
    if (IZELServerStatus* failure = platform_.acquire()) {
        return failure;
    }
    implementation_ = xercesc::DOMImplementationRegistry::getDOMImplementation(kCoreFeature);
    if (implementation_ == nullptr) {
        platform_.reset();
        return makeStatus(msg::kXmlFailure, kNotSupported);
    }
    return nullptr;
}

XmlElement* XmlDocument::createDocument(std::string_view namespaceUri, std::string_view rootName)
{
    if (!started()) {
        return nullptr;
    }
    releaseDocument();
    const XmlText xmlNamespace(namespaceUri);
    const XmlText xmlRoot(rootName);
    if (!xmlNamespace.valid() || !xmlRoot.valid()) {
        return nullptr;
    }
    try {
        document_ = implementation_->createDocument(namespaceUri.empty() ? nullptr : xmlNamespace.get(), xmlRoot.get(),
                                                    nullptr);
    } catch (...) {
        rethrowIfOutOfMemory();
        document_ = nullptr;
    }
    return documentElement();
}

XmlElement* XmlDocument::createElement(std::string_view name)
{
    if (document_ == nullptr) {
        return nullptr;
    }
    const XmlText xmlName(name);
    if (!xmlName.valid()) {
        return nullptr;
    }
    try {
        return elements_.wrap(document_->createElement(xmlName.get()));
    } catch (...) {
        rethrowIfOutOfMemory();
        return nullptr;
    }
}

XmlElement* XmlDocument::documentElement()
{
    if (root_ == nullptr && document_ != nullptr) {
        root_ = elements_.wrap(document_->getDocumentElement());
    }
    return root_;
}

IZELServerStatus* XmlDocument::serialize(std::string& out) const
{
    if (document_ == nullptr) {
        return makeStatus(msg::kSerializeFailed, "There is no document to write");
    }
    try {
        xercesc::DOMImplementationLS* ls = xercesc::DOMImplementationRegistry::getDOMImplementation(kLsFeature);
        if (ls == nullptr) {
            return makeStatus(msg::kSerializeFailed, kNotSupported);
        }
        SerializerPtr serializer(ls->createLSSerializer());
        xercesc::DOMConfiguration& config = *serializer->getDomConfig();
        setIfSupported(config, xercesc::XMLUni::fgDOMWRTDiscardDefaultContent, true);
        setIfSupported(config, xercesc::XMLUni::fgDOMWRTFormatPrettyPrint, false);
        setIfSupported(config, xercesc::XMLUni::fgDOMWRTBOM, false);

        xercesc::MemBufFormatTarget target(kInitialTargetCapacity);
        OutputPtr output(ls->createLSOutput());
        output->setByteStream(&target);
        if (!serializer->write(document_, output.get())) {
            return makeStatus(msg::kSerializeFailed, "The document could not be written");
        }
        out.assign(reinterpret_cast<const char*>(target.getRawBuffer()), target.getLen());
        return nullptr;
    } catch (...) {
        return makeStatus(msg::kSerializeFailed, currentXmlExceptionMessage());
    }
}

void XmlDocument::releaseDocument() noexcept
{
    root_ = nullptr;
    elements_.clear();
    if (document_ != nullptr) {
        document_->release();
        document_ = nullptr;
    }
}

}  // namespace zel
