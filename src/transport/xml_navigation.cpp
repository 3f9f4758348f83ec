#include "transport/xml_navigation.h"

#include <xercesc/dom/DOMAttr.hpp>
#include <xercesc/dom/DOMCharacterData.hpp>
#include <xercesc/dom/DOMNode.hpp>
#include <xercesc/util/XMLString.hpp>

#include "transport/xml_document.h"
#include "transport/xml_transcode.h"

namespace zel {
namespace {

using xercesc::DOMElement;
using xercesc::DOMNode;

DOMElement* asElement(DOMNode* node)
{
    return node != nullptr && node->getNodeType() == DOMNode::ELEMENT_NODE ? static_cast<DOMElement*>(node) : nullptr;
}

bool sameIgnoringCase(const DOMElement* element, const XmlText& name)
{
    return xercesc::XMLString::compareIString(element->getTagName(), name.get()) == 0;
}

// The node after `node` in document order, staying below `scope`; null at the end of the subtree.
DOMNode* nextInScope(DOMNode* node, const DOMNode* scope)
{
    if (DOMNode* child = node->getFirstChild()) {
        return child;
    }
    while (node != scope) {
        if (DOMNode* sibling = node->getNextSibling()) {
            return sibling;
        }
        node = node->getParentNode();
    }
    return nullptr;
}

// Calls `visit` for every element of the subtree of `scope` (itself included) in document order
// until it returns false.
template <class Visit>
void forEachElement(const XmlElement* scope, Visit visit)
{
    DOMNode* const root = scope->node();
    for (DOMNode* node = root; node != nullptr; node = nextInScope(node, root)) {
        if (DOMElement* element = asElement(node); element != nullptr && !visit(element)) {
            return;
        }
    }
}

// forEachElement over the elements tagged exactly `tag`; none for a null scope or a tag that does
// not transcode.
template <class Visit>
void forEachNamed(const XmlElement* scope, std::string_view tag, Visit visit)
{
    if (scope == nullptr) {
        return;
    }
    const XmlText wanted(tag);
    if (!wanted.valid()) {
        return;
    }
    forEachElement(scope, [&](DOMElement* element) {
        return !xercesc::XMLString::equals(element->getTagName(), wanted.get()) || visit(element);
    });
}

template <class Match>
std::vector<XmlElement*> collectChildren(const XmlElement* parent, Match match)
{
    std::vector<XmlElement*> found;
    for (DOMNode* node = parent->node()->getFirstChild(); node != nullptr; node = node->getNextSibling()) {
        DOMElement* element = asElement(node);
        if (element == nullptr || !match(element)) {
            continue;
        }
        if (XmlElement* wrapper = parent->owner().wrap(element)) {
            found.push_back(wrapper);
        }
    }
    return found;
}

}  // namespace

XmlElement* findChild(const XmlElement* parent, std::string_view name)
{
    if (parent == nullptr) {
        return nullptr;
    }
    const XmlText wanted(name);
    if (!wanted.valid()) {
        return nullptr;
    }
    for (DOMNode* node = parent->node()->getFirstChild(); node != nullptr; node = node->getNextSibling()) {
        if (DOMElement* element = asElement(node); element != nullptr && sameIgnoringCase(element, wanted)) {
            return parent->owner().wrap(element);
        }
    }
    return nullptr;
}

std::vector<XmlElement*> childElements(const XmlElement* parent)
{
    if (parent == nullptr) {
        return {};
    }
    return collectChildren(parent, [](const DOMElement*) { return true; });
}

std::vector<XmlElement*> childElements(const XmlElement* parent, std::string_view name)
{
    if (parent == nullptr) {
        return {};
    }
    const XmlText wanted(name);
    if (!wanted.valid()) {
        return {};
    }
    return collectChildren(parent, [&wanted](const DOMElement* element) { return sameIgnoringCase(element, wanted); });
}

std::vector<XmlElement*> elementsNamed(const XmlElement* scope, std::string_view tag)
{
    std::vector<XmlElement*> found;
    forEachNamed(scope, tag, [&](DOMElement* element) {
        if (XmlElement* wrapper = scope->owner().wrap(element)) {
            found.push_back(wrapper);
        }
        return true;
    });
    return found;
}

XmlElement* firstElementNamed(const XmlElement* scope, std::string_view tag)
{
    XmlElement* found = nullptr;
    forEachNamed(scope, tag, [&](DOMElement* element) {
        found = scope->owner().wrap(element);
        return false;
    });
    return found;
}

bool getAttribute(const XmlElement* element, std::string_view name, std::string& out)
{
    out.clear();
    if (element == nullptr) {
        return false;
    }
    const XmlText wanted(name);
    if (!wanted.valid()) {
        return false;
    }
    const xercesc::DOMAttr* attribute = element->node()->getAttributeNode(wanted.get());
    if (attribute == nullptr) {
        return false;
    }
    out = toUtf8(attribute->getValue());
    return true;
}

std::string textContent(const XmlElement* element)
{
    std::string text;
    if (element == nullptr) {
        return text;
    }
    DOMNode* const root = element->node();
    for (DOMNode* node = root; node != nullptr; node = nextInScope(node, root)) {
        const auto type = node->getNodeType();
        if (type == DOMNode::TEXT_NODE || type == DOMNode::CDATA_SECTION_NODE) {
            text += toUtf8(static_cast<xercesc::DOMCharacterData*>(node)->getData());
        }
    }
    return text;
}

}  // namespace zel
