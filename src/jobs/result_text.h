#pragma once
// The job result text and the job status words, without any object or connection around them.
//
// A result text is a series of entries separated by NUL bytes, each name "=" value (the name ends at
// the first "=", the value may hold more). Entries are kept under "*" followed by their name, which
// keeps them apart from the pieces split out of the "result" entry, kept without the prefix.

#include <map>
#include <optional>
#include <string>
#include <string_view>

namespace zel {

// Property name -> value, in name order.
using ResultProperties = std::map<std::string, std::string>;

// Prefix of every property read from the result text itself.
inline constexpr char kResultPropertyPrefix = '*';

// Stores every entry of `text` that holds "=" as "*" name -> value; entries without "=" are skipped,
// a later entry replaces an earlier one of the same name, and nothing is removed.
void parseResultEntries(std::string_view text, ResultProperties& properties);

// Splits the value of "*result" (when present) at "|". Leading pieces of the form number ":" message
// (holding ":" and no "=") set "StatusNumber" and "StatusMessage" (an empty side leaves its property
// alone; a later piece wins); the first piece of another form ends that run. Every piece holding "="
// is stored as name -> value, without the prefix.
void splitResultValue(ResultProperties& properties);

// The job status code of a status word: its position among the eleven words, compared exactly.
std::optional<unsigned> jobStatusCode(std::string_view word);
// The word of a code; null for a code past the last word.
const char* jobStatusWord(unsigned code);

inline constexpr unsigned kJobStatusSuccess = 7;

}  // namespace zel
