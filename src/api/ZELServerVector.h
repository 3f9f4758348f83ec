#pragma once
// The owning collection behind every IZELServerVector<I> the library hands out. `I` is the element
// interface (its destructor must be virtual), `C` the library's concrete element class; the vector
// owns every pointer it holds and destroys what it still holds when it is destroyed.

#include <type_traits>
#include <vector>

#include <zelserverapi/IZELServerVector.h>

#include "api/heap.h"

namespace zel {

// The slot that element() lends for an index past the end, one per element interface. Callers may
// write through the reference they get, so the slot is reset on every such call. It is per thread:
// sessions on different threads then never race on it, and on one thread it behaves as one slot.
template <class I>
I*& vectorNullSlot()
{
    thread_local I* slot = nullptr;
    slot = nullptr;
    return slot;
}

template <class I, class C>
class ZELServerVector final : public IZELServerVector<I>, public HeapObject {
    static_assert(std::is_base_of_v<I, C>, "the concrete element class must implement the interface");
    static_assert(std::has_virtual_destructor_v<I>, "elements are destroyed through their interface");

public:
    ZELServerVector() = default;
    ZELServerVector(const ZELServerVector&) = delete;
    ZELServerVector& operator=(const ZELServerVector&) = delete;
    ~ZELServerVector() override { clearAndDestroy(); }

    void append(I* item) override
    {
        if (item != nullptr) {
            items_.push_back(item);
        }
    }

    void insertAt(unsigned index, I* item) override
    {
        if (item == nullptr) {
            return;
        }
        if (index >= items_.size()) {
            items_.push_back(item);
        } else {
            items_.insert(items_.begin() + index, item);
        }
    }

    I*& element(unsigned index) override { return index < items_.size() ? items_[index] : vectorNullSlot<I>(); }

    I* removeLast() override
    {
        if (items_.empty()) {
            return nullptr;
        }
        I* last = items_.back();
        items_.pop_back();
        return last;
    }

    unsigned entries() const override { return static_cast<unsigned>(items_.size()); }

    void clear() override { items_.clear(); }

    void clearAndDestroy() override
    {
        // Counted by entries, not by the pointer: a caller may have stored null through element().
        while (!items_.empty()) {
            delete removeLast();
        }
    }

    // Read access for the library's own code: null for an index past the end.
    I* at(unsigned index) const { return index < items_.size() ? items_[index] : nullptr; }

private:
    std::vector<I*> items_;
};

}  // namespace zel
