#pragma once
// A string-to-string dictionary that the caller and the library compile from this one declaration.
// Keys are compared exactly (case-sensitive) and kept in key order. Operations that take
// directives accept a dictionary, or null for none.

#include <cstddef>
#include <map>
#include <string>

class ZELServerStringDict {
public:
    using Map = std::map<std::string, std::string>;
    using const_iterator = Map::const_iterator;

    ZELServerStringDict() = default;
    ZELServerStringDict(const ZELServerStringDict&) = default;
    ZELServerStringDict& operator=(const ZELServerStringDict&) = default;
    virtual ~ZELServerStringDict() = default;

    // Sets a key; a key that is already present gets the new value.
    void insert(const std::string& key, const std::string& value) { entries_[key] = value; }
    void insert(const char* key, const char* value)
    {
        insert(std::string(key ? key : ""), std::string(value ? value : ""));
    }

    // The value of a key, or null when the key is absent. The pointer is valid until the next change.
    const std::string* find(const std::string& key) const
    {
        const auto it = entries_.find(key);
        return it == entries_.end() ? nullptr : &it->second;
    }
    const char* lookup(const char* key) const
    {
        const std::string* value = find(std::string(key ? key : ""));
        return value ? value->c_str() : nullptr;
    }
    bool contains(const std::string& key) const { return entries_.count(key) != 0; }
    bool remove(const std::string& key) { return entries_.erase(key) != 0; }
    void clear() { entries_.clear(); }

    std::size_t entries() const { return entries_.size(); }
    bool empty() const { return entries_.empty(); }
    const_iterator begin() const { return entries_.begin(); }
    const_iterator end() const { return entries_.end(); }

private:
    Map entries_;
};
