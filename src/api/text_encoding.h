#pragma once
// Re-encoding between UTF-8 and Latin-1 (the single-byte code page the library treats as local).

#include <string>
#include <string_view>

namespace zel {

// True when the bytes are well-formed UTF-8 (no overlong forms, no surrogates, nothing past U+10FFFF).
bool isValidUtf8(std::string_view text);

// Every byte becomes the character of the same number; lossless.
std::string latin1ToUtf8(std::string_view text);

// Characters above U+00FF become one '?' each, and so does every byte that is not part of a
// well-formed sequence: the result is lossy but always has one byte per character read.
std::string utf8ToLatin1(std::string_view text);

}  // namespace zel
