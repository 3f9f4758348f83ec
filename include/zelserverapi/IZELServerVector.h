#pragma once
// An ordered collection of library objects that owns every element it holds: destroying the vector
// (through the session's matching destroy operation) destroys its elements too.

template <class I>
class IZELServerVector {
public:
    // Appends the item and takes ownership of it; a null item is ignored. An item that cannot be
    // stored (memory exhausted) is destroyed.
    virtual void append(I* item) = 0;
    // Inserts before position `index`; an index past the end appends. Ownership as for append.
    virtual void insertAt(unsigned index, I* item) = 0;
    // The stored pointer at `index`. An index at or past entries() gives a reference to a shared
    // slot that holds null (reset on every such call): writing through it changes no element.
    virtual I*& element(unsigned index) = 0;
    // Removes the last element and hands its ownership to the caller; null when empty.
    virtual I* removeLast() = 0;
    virtual unsigned entries() const = 0;
    // Forgets every element without destroying it (the caller must own them already).
    virtual void clear() = 0;
    // Destroys every element, last first.
    virtual void clearAndDestroy() = 0;
    virtual ~IZELServerVector() = default;

protected:
    IZELServerVector() = default;
    IZELServerVector(const IZELServerVector&) = default;
    IZELServerVector& operator=(const IZELServerVector&) = default;
};
