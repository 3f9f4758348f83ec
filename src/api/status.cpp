#include "api/status.h"

#include "api/ZELServerStatus.h"

namespace zel {

IZELServerStatus* makeStatus(unsigned number) { return new ZELServerStatus(number); }

IZELServerStatus* makeStatus(unsigned number, const std::string& parameter)
{
    return new ZELServerStatus(number, parameter);
}

IZELServerStatus* makeStatus(unsigned number, const std::vector<std::string>& parameters)
{
    return new ZELServerStatus(number, parameters);
}

IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number) { return new ZELServerStatus(code, number); }

IZELServerStatus* makeStatusWithCode(unsigned code, unsigned number, const std::string& parameter)
{
    return new ZELServerStatus(code, number, parameter);
}

}  // namespace zel
