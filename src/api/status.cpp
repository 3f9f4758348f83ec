#include "api/status.h"

#include "api/ZELServerStatus.h"

namespace zel {

IZELServerStatus* makeStatus(unsigned number, Where where) { return new ZELServerStatus(number, {}, where); }

IZELServerStatus* makeStatus(unsigned number, const std::string& parameter, Where where)
{
    return new ZELServerStatus(number, {parameter}, where);
}

IZELServerStatus* makeStatus(unsigned number, const std::vector<std::string>& parameters, Where where)
{
    return new ZELServerStatus(number, parameters, where);
}

IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number, Where where)
{
    return new ZELServerStatus(code, number, {}, where);
}

IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number, const std::string& parameter, Where where)
{
    return new ZELServerStatus(code, number, {parameter}, where);
}

}  // namespace zel
