#pragma once
// The library's list of texts (duplicates allowed, insertion order kept). The session hands these
// out through createStringArray; inside the library it is also the flat pair list of directives,
// published parameters and notifications (name, value, name, value; an odd last entry ignored).
//
// Indexes past the end are a caller error; rather than read or write out of bounds, element() gives
// "", getElement() leaves `out` untouched and setElement() changes nothing (both still return 0).

#include <string>
#include <vector>

#include <zelserverapi/IZELServerStringArray.h>

#include "api/heap.h"

namespace zel {

class ZELServerStringArray final : public IZELServerStringArray, public HeapObject {
public:
    ZELServerStringArray() = default;
    explicit ZELServerStringArray(std::vector<std::string> elements) : elements_(std::move(elements)) {}
    ZELServerStringArray(const ZELServerStringArray& other) : IZELServerStringArray(), elements_(other.elements_) {}
    ZELServerStringArray& operator=(const ZELServerStringArray& other);
    ~ZELServerStringArray() override = default;

    void append(const IZELServerString& value) override;
    // A null text appends the empty text.
    void append(const char* value) override;
    const char* element(unsigned index) const override;
    int getElement(unsigned index, IZELServerString& out) const override;
    int setElement(unsigned index, const IZELServerString& value) override;
    unsigned entries() const override { return static_cast<unsigned>(elements_.size()); }
    void clear() override { elements_.clear(); }
    bool contains(const IZELServerString& value) const override;
    bool contains(const char* value) const override;
    // Every delimiter character ends a field, so adjacent delimiters give an empty field and a
    // delimiter at either end gives an empty first or last field: "a;;b" appends a, "", b. An empty
    // text appends nothing; an empty delimiter appends the whole text as one field.
    void appendTokens(const char* text, const char* delimiter) override;
    // Runs of delimiters give no empty pieces: ";;a; b;;" with "; " appends a and b.
    void appendTokensAnyOf(const char* text, const char* delimiters) override;
    unsigned removeAll(const IZELServerString& value) override;
    unsigned removeAll(const char* value) override;

    void append(std::string value) { elements_.push_back(std::move(value)); }
    const std::vector<std::string>& items() const { return elements_; }

private:
    bool containsBytes(const std::string& value) const;
    unsigned removeBytes(const std::string& value);

    std::vector<std::string> elements_;
};

}  // namespace zel
