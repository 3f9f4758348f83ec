#pragma once
// Making status objects. Every failure inside the library becomes one of these; the text comes from
// the message catalogue with the parameters filled in. Each returns an owned status, or null only
// when memory is exhausted.

#include <string>
#include <vector>

#include <zelserverapi/IZELServerStatus.h>

namespace zel {

IZELServerStatus* makeStatus(unsigned number);
IZELServerStatus* makeStatus(unsigned number, const std::string& parameter);
IZELServerStatus* makeStatus(unsigned number, const std::vector<std::string>& parameters);
IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number);
IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number, const std::string& parameter);

}  // namespace zel
