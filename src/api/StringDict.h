#pragma once
// Dictionaries of text: the connection properties (StringDict) and the helpers that move a public
// ZELServerStringDict to and from a flat pair list (name, value, name, value).

#include <string>
#include <unordered_map>

#include <zelserverapi/IZELServerStringArray.h>
#include <zelserverapi/ZELServerStringDict.h>

#include "api/heap.h"

namespace zel {

// Connection properties, keyed by exact bytes (case-sensitive). Built from a flat pair list: fewer
// than two elements give an empty dictionary, an odd last element is ignored, and when a key comes
// twice the first value is kept (the later one is taken as a stray repetition, not a correction).
class StringDict : public HeapObject {
public:
    using Map = std::unordered_map<std::string, std::string>;
    using const_iterator = Map::const_iterator;

    StringDict();
    explicit StringDict(const IZELServerStringArray& pairs);
    StringDict(const StringDict&) = default;
    StringDict& operator=(const StringDict&) = default;
    virtual ~StringDict() = default;

    // Adds the key unless it is already present; returns whether it was added.
    bool insert(const std::string& key, const std::string& value);
    // The value of the key, or null when absent; valid until the dictionary changes.
    const std::string* find(const std::string& key) const;
    bool contains(const std::string& key) const { return entries_.count(key) != 0; }

    std::size_t entries() const { return entries_.size(); }
    bool empty() const { return entries_.empty(); }
    const_iterator begin() const { return entries_.begin(); }
    const_iterator end() const { return entries_.end(); }

private:
    Map entries_;
};

// The bytes of one element of any implementation of the list, embedded NULs included.
std::string elementBytes(const IZELServerStringArray& list, unsigned index);

// Calls store(name, value) for each pair of the flat list in order; an odd last element is ignored.
template <class Store>
void forEachPair(const IZELServerStringArray& pairs, Store store)
{
    const unsigned count = pairs.entries();
    for (unsigned i = 1; i < count; i += 2) {
        store(elementBytes(pairs, i - 1), elementBytes(pairs, i));
    }
}

// Sets every pair of the flat list into `into`; an odd last element is ignored and a later pair
// replaces an earlier one with the same key.
void insertPairs(const IZELServerStringArray& pairs, ZELServerStringDict& into);
ZELServerStringDict toStringDict(const IZELServerStringArray& pairs);

// Appends key, value, key, value ... in key order (the list is not cleared first).
void appendPairs(const ZELServerStringDict& dict, IZELServerStringArray& out);

}  // namespace zel
