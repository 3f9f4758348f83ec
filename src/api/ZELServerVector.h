#pragma once
// The collection behind every IZELServerVector<I> the library hands out. `I` is the element
// interface (its destructor must be virtual), `C` the library's concrete element class. An owning
// vector destroys what it still holds when it is destroyed; a borrowing one (BorrowedVector) lists
// objects owned elsewhere and never destroys an element, not even through clearAndDestroy.

#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <type_traits>
#include <vector>

#include <zelserverapi/IZELServerVector.h>

#include "api/exception_guard.h"
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

// Who destroys a vector's elements.
enum class Elements { kOwned, kBorrowed };

template <class I, class C, Elements kElements = Elements::kOwned>
class ZELServerVector final : public IZELServerVector<I>, public HeapObject {
    static_assert(std::is_base_of_v<I, C>, "the concrete element class must implement the interface");
    static_assert(std::has_virtual_destructor_v<I>, "elements are destroyed through their interface");

public:
    ZELServerVector() = default;
    ZELServerVector(const ZELServerVector&) = delete;
    ZELServerVector& operator=(const ZELServerVector&) = delete;
    ~ZELServerVector() override { clearAndDestroy(); }

    void append(I* item) override { insertAt(entries(), item); }

    void insertAt(unsigned index, I* item) override
    {
        if (item == nullptr) {
            return;
        }
        const bool stored = guarded([&] {
            items_.insert(items_.begin() + std::min<std::size_t>(index, items_.size()), item);
            return true;
        });
        // The caller handed ownership over with the call: an element that cannot be stored is
        // destroyed rather than leaked.
        if (!stored && kElements == Elements::kOwned) {
            delete item;
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
        if constexpr (kElements == Elements::kBorrowed) {
            items_.clear();  // the owner's own vector destroys them
        } else {
            // Counted by entries, not by the pointer: a caller may have stored null through element().
            while (!items_.empty()) {
                delete removeLast();
            }
        }
    }

    // Read access for the library's own code: null for an index past the end.
    I* at(unsigned index) const { return index < items_.size() ? items_[index] : nullptr; }

private:
    std::vector<I*> items_;
};

// Appends through the interface, for the library's own filling of a vector (a reply read into the
// caller's vector, a listing): when the vector could not store the element (it has then destroyed an
// owned one), the operation fails by an exception, rather than going on with a list that silently
// lacks an element, or with an element that is gone. A null item is ignored, as by append.
template <class I>
void appendOrThrow(IZELServerVector<I>& vector, I* item)
{
    const unsigned before = vector.entries();
    vector.append(item);
    if (item != nullptr && vector.entries() == before) {
        throw std::runtime_error("An element could not be stored.");
    }
}

// A vector of objects that belong to another vector: a workspace's source and destination feature
// types, which belong to their datasets.
template <class I>
using BorrowedVector = ZELServerVector<I, I, Elements::kBorrowed>;

}  // namespace zel
