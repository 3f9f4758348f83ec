#pragma once
// A collection that lists objects owned elsewhere: a workspace's source and destination feature
// types, which belong to their datasets. It never destroys an element, not even through
// clearAndDestroy, because the owner's own vector will.

#include <vector>

#include <zelserverapi/IZELServerVector.h>

#include "api/ZELServerVector.h"
#include "api/heap.h"

namespace zel {

template <class I>
class BorrowedVector final : public IZELServerVector<I>, public HeapObject {
public:
    BorrowedVector() = default;
    BorrowedVector(const BorrowedVector&) = delete;
    BorrowedVector& operator=(const BorrowedVector&) = delete;
    ~BorrowedVector() override = default;

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
    void clearAndDestroy() override { items_.clear(); }

private:
    std::vector<I*> items_;
};

}  // namespace zel
