#pragma once
// Making status objects. Every failure inside the library becomes one of these; the text comes from
// the message catalogue with the parameters filled in. Each returns an owned status, or null only
// when memory is exhausted. Each status records where in the library it was made (`where`, the
// caller's line unless given): for the library's own tests and debugging, never in the public text.

#include <source_location>
#include <string>
#include <vector>

#include <zelserverapi/IZELServerStatus.h>

namespace zel {

using Where = std::source_location;

IZELServerStatus* makeStatus(unsigned number, Where where = Where::current());
IZELServerStatus* makeStatus(unsigned number, const std::string& parameter, Where where = Where::current());
IZELServerStatus* makeStatus(unsigned number, const std::vector<std::string>& parameters,
                             Where where = Where::current());
IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number, Where where = Where::current());
IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number, const std::string& parameter,
                                     Where where = Where::current());

}  // namespace zel
