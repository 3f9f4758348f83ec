#pragma once
// The repository's own argument checks and directive lists, for its commands on the command path
// (transport/checked_command.h):
//
//     return on("REP_ITEMEXISTS")
//         .require(itemName).check(allowedName(itemName))
//         .add("itemName", itemName)
//         .askFlag(exists);

#include <string>

#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/ZELServerStringDict.h>

#include "api/ZELServerStringArray.h"
#include "transport/checked_command.h"

namespace zel {

// The characters no repository, item or resource name may hold, as the status names them.
inline constexpr const char* kForbiddenNameCharacters = "\\/:*?\"<>|&='+%";

// True when the name holds none of kForbiddenNameCharacters.
bool isAllowedName(const IZELServerString& name);

// 393626 (parameter: the forbidden characters) when the name holds one of them.
Check allowedName(const IZELServerString& name, Where where = Where::current());
// 393627 when a resource has exactly the name of its item.
Check distinct(const IZELServerString& resourceName, const IZELServerString& itemName, Where where = Where::current());

// The "enableFilter" value the server knows for the caller's "ENABLE_FILTER" directive ("ALL",
// "ENABLED", "DISABLED", compared exactly, give "All", "Enabled", "Disabled"); empty for any other
// value and for a missing key.
std::string enableFilterFor(const ZELServerStringDict& directives);

// The directive list of the filtered lists: "enableFilter" followed by "All" without directives, or
// by the value for the caller's "ENABLE_FILTER". A missing or unknown filter leaves the list with its
// one entry, which the caller refuses (393619).
ZELServerStringArray enableFilterList(const ZELServerStringDict* directives);

}  // namespace zel
