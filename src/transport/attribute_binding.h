#pragma once
// The one way an object reads its fields from its element: a table that binds each XML attribute to
// a field of the object's field record. A reader is then its table plus, for the kinds that contain
// other objects, the children it collects.
//
//     constexpr AttributeBinding<SummaryFields> kSummaryAttributes[] = {
//         {"name", &SummaryFields::name},
//         {"is_enabled", &SummaryFields::enabled},
//     };
//     readAttributes(element, summary.fields(), kSummaryAttributes);
//
// Every binding is applied, in table order. A missing attribute reads as the empty text, so text
// fields become empty, flags false and numbers 0; no reader refuses an element for what it lacks.
// Flags are the server's truth values (first letter T/Y/F/N, else a number that is not zero). Signed
// numbers are whole decimal or hexadecimal numbers; unsigned ones are the same without a sign (a
// minus sign is refused rather than wrapped round); text that does not convert, or a value that does
// not fit the field, reads as 0. An attribute whose text is none of these kinds binds a conversion
// of its own (a Store), written at the table entry.

#include <cstdint>
#include <string>
#include <type_traits>
#include <variant>

#include "transport/xml_document.h"

namespace zel {

void storeAttributeText(const std::string& text, std::string& field);
void storeAttributeText(const std::string& text, bool& field);
void storeAttributeText(const std::string& text, std::int32_t& field);
void storeAttributeText(const std::string& text, std::int64_t& field);
void storeAttributeText(const std::string& text, std::uint32_t& field);

// The attribute's text, empty when the element does not have it.
std::string attributeText(const XmlElement& element, const char* attribute);

template <class Fields>
struct AttributeBinding {
    // A conversion of the attribute's own, for text that is none of the common kinds.
    using Store = void (*)(const std::string& text, Fields& fields);
    using Field = std::variant<std::string Fields::*, bool Fields::*, std::int32_t Fields::*, std::int64_t Fields::*,
                               std::uint32_t Fields::*, Store>;

    const char* attribute;
    Field field;
};

template <class Fields, std::size_t N>
void readAttributes(const XmlElement& element, Fields& fields, const AttributeBinding<Fields> (&bindings)[N])
{
    using Store = typename AttributeBinding<Fields>::Store;
    for (const AttributeBinding<Fields>& binding : bindings) {
        const std::string text = attributeText(element, binding.attribute);
        std::visit(
            [&](auto field) {
                if constexpr (std::is_same_v<decltype(field), Store>) {
                    field(text, fields);
                } else {
                    storeAttributeText(text, fields.*field);
                }
            },
            binding.field);
    }
}

}  // namespace zel
