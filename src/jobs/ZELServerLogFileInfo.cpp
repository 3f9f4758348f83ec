#include "jobs/ZELServerLogFileInfo.h"

#include <string>

#include "api/conversions.h"
#include "transport/attribute_binding.h"
#include "transport/object_reader.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

constexpr AttributeBinding<LogFileInfoFields> kLogFileInfoAttributes[] = {
    // Not checked: a number followed by other text has been stored by then and is kept.
    {"size", +[](const std::string& text, LogFileInfoFields& fields) { storeUInt32(text, fields.size); }},
};

}  // namespace

bool ZELServerLogFileInfo::readFromXml(const XmlElement& documentElement)
{
    // Servers differ in the case of this element's name, so it is matched ignoring case.
    const XmlElement* description = findChild(&documentElement, "LOGFILEINFO");
    if (description == nullptr) {
        return true;
    }
    readAttributes(*description, fields_, kLogFileInfoAttributes);
    return true;
}

int readLogFileInfoReply(std::string_view body, IZELServerLogFileInfo& info)
{
    return readReplyDocument(body, [&info](const XmlElement& root) {
        auto* concrete = dynamic_cast<ZELServerLogFileInfo*>(&info);
        return concrete != nullptr && concrete->readFromXml(root);
    });
}

}  // namespace zel
