#pragma once
// Reading helpers over parsed (or built) elements. Every helper accepts a null element and then finds
// nothing. Element handles they return belong to the same owner as the element they start from
// (see xml_document.h). Names and values are UTF-8 byte strings. Walks are iterative, so deeply
// nested hostile replies cannot exhaust the stack.

#include <string>
#include <string_view>
#include <vector>

#include "transport/xml_document.h"

namespace zel {

// The first direct child element whose tag name equals `name` ignoring case; null when none.
XmlElement* findChild(const XmlElement* parent, std::string_view name);

// All direct child elements, in document order.
std::vector<XmlElement*> childElements(const XmlElement* parent);
// The direct child elements whose tag name equals `name` ignoring case, in document order.
std::vector<XmlElement*> childElements(const XmlElement* parent, std::string_view name);

// `scope` itself and every element below it whose tag name equals `tag` exactly, in document order.
// Given a document element, that is every element of the tag anywhere in the document.
std::vector<XmlElement*> elementsNamed(const XmlElement* scope, std::string_view tag);
// The first of elementsNamed(), without collecting the rest; null when none.
XmlElement* firstElementNamed(const XmlElement* scope, std::string_view tag);

// Looks the attribute up by its exact (case-sensitive) name. True with its value in `out` when
// present; false with `out` emptied when absent.
bool getAttribute(const XmlElement* element, std::string_view name, std::string& out);

// The concatenated text of the element and all its descendants (text and CDATA sections).
std::string textContent(const XmlElement* element);

}  // namespace zel
