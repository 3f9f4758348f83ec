// Texts the library reads apart from XML: a job result text with every property through every
// typed getter (first byte 0), and a server's web address (any other first byte).
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "jobs/jobs_factories.h"
#include "session/ZELServerConnectionInfo.h"

namespace {

void readResult(std::string_view text)
{
    using namespace zel;
    std::unique_ptr<IZELServerTransformationResult> result(
        makeTransformationResult(ZELServerString(text.data(), static_cast<unsigned>(text.size()))));
    unsigned number = 0;
    float real = 0;
    ZELServerString out;
    result->getID(number);
    result->getJobStatus(number);
    result->getDescription(out);
    result->getStatusNumber(number);
    result->getRequesterResultPort(number);
    ZELServerStringArray names;
    result->getPropertyNames(names);
    for (const std::string& name : names.items()) {
        result->getUIntProperty(name, number);
        result->getUIntPropertyAnyBase(name, number);
        result->getFloatProperty(name, real);
        result->getBoolProperty(name, number);
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    if (size == 0)
        return 0;
    std::string_view text(reinterpret_cast<const char*>(data) + 1, size - 1);
    if (data[0] == 0)
        readResult(text);
    else
        zel::parseServerAddress(text);
    return 0;
}
