#pragma once
// ZELServerDOMNodeList: the ordered, owning list of the element wrappers handed out for one DOM
// document. Wrappers stay valid until the list is cleared or destroyed, which their document (or
// reader) does when it releases its DOM.

#include <cstddef>
#include <unordered_map>
#include <vector>

#include <xercesc/dom/DOMElement.hpp>

#include "api/heap.h"

namespace zel {

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
    // Null for a null node or when memory is exhausted.
    XmlElement* wrap(xercesc::DOMElement* node) noexcept;

    std::size_t size() const noexcept { return wrappers_.size(); }

private:
    std::vector<XmlElement*> wrappers_;
    // Walking a large reply more than once must not multiply the wrappers.
    std::unordered_map<const xercesc::DOMElement*, XmlElement*> byNode_;
};

}  // namespace zel
