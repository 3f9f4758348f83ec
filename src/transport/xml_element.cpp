#include "transport/xml_element.h"

#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/dom/DOMText.hpp>

#include "api/text_encoding.h"
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
    } catch (...) {  // a DOM exception for an illegal name, or the library out of memory
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
        return false;
    }
}

}  // namespace zel
