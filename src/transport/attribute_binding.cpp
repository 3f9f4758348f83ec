#include "transport/attribute_binding.h"

#include <limits>

#include "api/conversions.h"
#include "transport/xml_navigation.h"

namespace zel {

void storeAttributeText(const std::string& text, std::string& field) { field = text; }

void storeAttributeText(const std::string& text, bool& field) { field = toBooleanOrFalse(text); }

void storeAttributeText(const std::string& text, std::int32_t& field)
{
    const std::optional<std::int64_t> value = toInt64(text);
    const bool fits = value && *value >= std::numeric_limits<std::int32_t>::min() &&
                      *value <= std::numeric_limits<std::int32_t>::max();
    field = fits ? static_cast<std::int32_t>(*value) : 0;
}

void storeAttributeText(const std::string& text, std::int64_t& field) { field = toInt64(text).value_or(0); }

void storeAttributeText(const std::string& text, std::uint32_t& field) { field = toUInt32AnyBase(text).value_or(0); }

std::string attributeText(const XmlElement& element, const char* attribute)
{
    std::string text;
    getAttribute(&element, attribute, text);
    return text;
}

}  // namespace zel
