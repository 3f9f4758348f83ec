#pragma once
// The message catalogue: a table from message number to a text with numbered parameter slots, read
// from <home>/messages/zelserverapi.msg. The file format is described in
// ZELLocalizedMessageDatabase.cpp and at the top of messages/zelserverapi.msg.

#include <map>
#include <string>
#include <string_view>

#include "api/engine_strings.h"
#include "api/heap.h"

namespace zel {

class ZELLocalizedMessageDatabase : public HeapObject {
public:
    static constexpr const char* kCatalogueFolder = "messages";
    static constexpr const char* kCatalogueFile = "zelserverapi.msg";

    // Reads the catalogue under `homeDirectory` (with or without a trailing separator), replacing
    // whatever was loaded. False when the file cannot be read or is malformed; then the table is
    // empty and getLastErrorMessage tells why.
    bool initialize(const std::string& homeDirectory);

    // Loads catalogue text directly; `origin` names it in error messages. Same result as
    // initialize.
    bool load(std::string_view text, const std::string& origin);

    // Writes the text of `number` into `output` with slot %N replaced by element N-1 of
    // `parameters` (null means none). A slot without a parameter becomes empty, or stays as written
    // when `keepUnfilledSlots` is set. With `showNumbers` the text is prefixed "<number>: ".
    // False when the number has no text; `output` is then left alone.
    bool createFilledInMessage(unsigned number, const IZELStringArray* parameters, IZELString* output,
                               bool keepUnfilledSlots, bool showNumbers);

    // Why the last initialize, load or createFilledInMessage failed; empty when none did.
    const char* getLastErrorMessage() const { return lastError_.c_str(); }

    std::size_t size() const { return texts_.size(); }

private:
    bool fail(std::string message);

    std::map<unsigned, std::string> texts_;
    std::string origin_;
    std::string lastError_;
};

}  // namespace zel
