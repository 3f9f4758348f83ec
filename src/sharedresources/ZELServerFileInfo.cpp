#include "sharedresources/ZELServerFileInfo.h"

#include "api/ZELServerString.h"
#include "transport/attribute_binding.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

constexpr AttributeBinding<FileInfoFields> kFileInfoAttributes[] = {
    // Case matters: the server writes "DIR" for directories, and anything else is a file.
    {"filetype", +[](const std::string& text, FileInfoFields& fields) { fields.directory = text == "DIR"; }},
    {"size", &FileInfoFields::size},
    {"date", &FileInfoFields::date},
};

}  // namespace

void ZELServerFileInfo::getDate(IZELServerString& out) const { handOutText(fields_.date, out); }

bool ZELServerFileInfo::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kFileInfoAttributes);
    const XmlElement* pathElement = findChild(&element, "PATH");
    path_.readFrom(pathElement != nullptr ? *pathElement : element);
    return true;
}

}  // namespace zel
