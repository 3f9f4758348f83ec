#include "repository/repository_checks.h"

#include "api/ZELServerString.h"
#include "api/message_numbers.h"

namespace zel {

bool isAllowedName(const IZELServerString& name)
{
    return toStdString(name).find_first_of(kForbiddenNameCharacters) == std::string::npos;
}

Check allowedName(const IZELServerString& name, Where where)
{
    return {isAllowedName(name), msg::kForbiddenCharacter, {kForbiddenNameCharacters}, where};
}

Check distinct(const IZELServerString& resourceName, const IZELServerString& itemName, Where where)
{
    return {toStdString(resourceName) != toStdString(itemName), msg::kResourceNamedAsItem, {}, where};
}

std::string enableFilterFor(const ZELServerStringDict& directives)
{
    const std::string* filter = directives.find("ENABLE_FILTER");
    if (filter == nullptr) {
        return {};
    }
    if (*filter == "ALL") {
        return "All";
    }
    if (*filter == "ENABLED") {
        return "Enabled";
    }
    if (*filter == "DISABLED") {
        return "Disabled";
    }
    return {};
}

ZELServerStringArray enableFilterList(const ZELServerStringDict* directives)
{
    const std::string filter = directives == nullptr ? "All" : enableFilterFor(*directives);
    return filter.empty() ? ZELServerStringArray({"enableFilter"}) : ZELServerStringArray({"enableFilter", filter});
}

}  // namespace zel
