#include "sharedresources/ZELServerFileInfo.h"

#include "api/conversions.h"
#include "transport/xml_element.h"
#include "transport/xml_navigation.h"

namespace zel {

void ZELServerFileInfo::getDate(IZELServerString& out) const
{
    out.set(date_.data(), static_cast<unsigned>(date_.size()));
}

bool ZELServerFileInfo::readFrom(const XmlElement& element)
{
    std::string text;
    getAttribute(&element, "filetype", text);
    // Case matters: the server writes "DIR" for directories, and anything else is a file.
    directory_ = text == "DIR";
    getAttribute(&element, "size", text);
    // The any-base reader is the one that refuses a minus sign instead of wrapping it round to a
    // size of four gigabytes.
    size_ = toUInt32AnyBase(text).value_or(0);
    getAttribute(&element, "date", date_);
    const XmlElement* pathElement = findChild(&element, "PATH");
    path_.readFrom(pathElement != nullptr ? *pathElement : element);
    return true;
}

}  // namespace zel
