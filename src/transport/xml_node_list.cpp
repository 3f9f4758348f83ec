#include "transport/xml_node_list.h"

#include <new>

#include "transport/xml_element.h"

namespace zel {

ZELServerDOMNodeList::~ZELServerDOMNodeList() { clear(); }

void ZELServerDOMNodeList::clear() noexcept
{
    while (!wrappers_.empty()) {
        delete wrappers_.back();
        wrappers_.pop_back();
    }
    byNode_.clear();
}

XmlElement* ZELServerDOMNodeList::wrap(xercesc::DOMElement* node) noexcept
{
    if (node == nullptr) {
        return nullptr;
    }
    if (auto found = byNode_.find(node); found != byNode_.end()) {
        return found->second;
    }
    auto* wrapper = new XmlElement(node, *this);
    if (wrapper == nullptr) {
        return nullptr;
    }
    try {
        wrappers_.push_back(wrapper);
        byNode_.emplace(node, wrapper);
    } catch (const std::bad_alloc&) {
        if (!wrappers_.empty() && wrappers_.back() == wrapper) {
            wrappers_.pop_back();
        }
        delete wrapper;
        return nullptr;
    }
    return wrapper;
}

}  // namespace zel
