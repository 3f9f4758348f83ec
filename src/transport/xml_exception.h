#pragma once
// The message of the XML library's exception being handled, for the status that reports it.

#include <string>

namespace zel {

// Call only inside a catch block. Gives the library's own message (DOM, parse, transcoding, I/O or
// out-of-memory exceptions), the what() of a standard exception, or a fixed text for anything else.
std::string currentXmlExceptionMessage();

}  // namespace zel
