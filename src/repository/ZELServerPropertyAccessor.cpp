#include "repository/ZELServerPropertyAccessor.h"

#include <utility>

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "api/text_encoding.h"
#include "transport/attribute_binding.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

using PropertyVector = ZELServerVector<IZELServerProperty, ZELServerProperty>;

ZELServerProperty::Attributes attributesOf(const XmlElement& property)
{
    ZELServerProperty::Attributes attributes;
    for (const XmlElement* attribute : childElements(&property, "ATTRIBUTE")) {
        attributes[attributeText(*attribute, "name")] = attributeText(*attribute, "value");
    }
    return attributes;
}

// Property values are whatever the caller stored; text that is not UTF-8 is taken to be in the local
// single-byte encoding, as the request does with every other caller text.
bool setText(XmlElement& element, const char* name, const std::string& value)
{
    return isValidUtf8(value) ? element.setAttribute(name, value) : element.setAttributeLocal(name, value);
}

std::string textOf(const IZELServerProperty& property, void (IZELServerProperty::*getter)(IZELServerString&) const)
{
    ZELServerString text;
    (property.*getter)(text);
    return text.str();
}

XmlElement* appendElement(XmlDocument& document, XmlElement& parent, const char* tag)
{
    XmlElement* element = document.createElement(tag);
    return element != nullptr && parent.appendChild(element) ? element : nullptr;
}

bool writeProperty(XmlDocument& document, XmlElement& root, const std::string& category,
                   const IZELServerProperty& property)
{
    XmlElement* element = appendElement(document, root, "PROPERTY");
    if (element == nullptr || !setText(*element, "category", category) ||
        !setText(*element, "name", textOf(property, &IZELServerProperty::getName)) ||
        !setText(*element, "value", textOf(property, &IZELServerProperty::getValue))) {
        return false;
    }
    ZELServerStringArray pairs;
    property.getAttributes(pairs);
    const std::vector<std::string>& items = pairs.items();
    for (std::size_t i = 1; i < items.size(); i += 2) {
        XmlElement* attribute = appendElement(document, *element, "ATTRIBUTE");
        if (attribute == nullptr || !setText(*attribute, "name", items[i - 1]) ||
            !setText(*attribute, "value", items[i])) {
            return false;
        }
    }
    return true;
}

}  // namespace

// ---- Property ---------------------------------------------------------------------------------------

ZELServerProperty::ZELServerProperty(std::string category, std::string name, std::string value, Attributes attributes)
    : category_(std::move(category)),
      name_(std::move(name)),
      value_(std::move(value)),
      attributes_(std::move(attributes))
{}

ZELServerProperty::ZELServerProperty(const ZELServerProperty& other)
    : IZELServerProperty(),
      category_(other.category_),
      name_(other.name_),
      value_(other.value_),
      attributes_(other.attributes_)
{}

void ZELServerProperty::getCategory(IZELServerString& out) const { handOutText(category_, out); }
void ZELServerProperty::getName(IZELServerString& out) const { handOutText(name_, out); }
void ZELServerProperty::getValue(IZELServerString& out) const { handOutText(value_, out); }

bool ZELServerProperty::getAttribute(const IZELServerString& name, IZELServerString& value) const
{
    return guarded([&]() -> bool {
        const auto found = attributes_.find(toStdString(name));
        if (found == attributes_.end()) {
            return false;
        }
        copyText(found->second, value);
        return true;
    });
}

void ZELServerProperty::getAttributes(IZELServerStringArray& pairs) const
{
    guarded([&] {
        for (const auto& [name, value] : attributes_) {
            pairs.append(ZELServerString(name));
            pairs.append(ZELServerString(value));
        }
    });
}

void ZELServerProperty::setAttributes(const Attributes& attributes)
{
    for (const auto& [name, value] : attributes) {
        attributes_[name] = value;
    }
}

// ---- Accessor ---------------------------------------------------------------------------------------

const ZELServerPropertyAccessor::Category*
ZELServerPropertyAccessor::findCategory(const IZELServerString& category) const
{
    const auto found = categories_.find(toStdString(category));
    return found == categories_.end() ? nullptr : &found->second;
}

void ZELServerPropertyAccessor::getCategoryNames(IZELServerStringArray& names) const
{
    guarded([&] {
        for (const auto& entry : categories_) {
            names.append(ZELServerString(entry.first));
        }
    });
}

void ZELServerPropertyAccessor::getPropertyNames(const IZELServerString& category, IZELServerStringArray& names) const
{
    guarded([&] {
        if (const Category* properties = findCategory(category)) {
            for (const auto& entry : *properties) {
                names.append(ZELServerString(entry.first));
            }
        }
    });
}

bool ZELServerPropertyAccessor::getPropertyPairs(const IZELServerString& category, IZELServerStringArray& pairs) const
{
    return guarded([&]() -> bool {
        const Category* properties = findCategory(category);
        if (properties == nullptr) {
            return false;
        }
        for (const auto& [name, property] : *properties) {
            pairs.append(ZELServerString(name));
            pairs.append(ZELServerString(property.value()));
        }
        return true;
    });
}

bool ZELServerPropertyAccessor::getPropertyValue(const IZELServerString& category, const IZELServerString& name,
                                                 IZELServerString& value) const
{
    return guarded([&]() -> bool {
        value.set("", 0);
        const IZELServerProperty* property = getProperty(category, name);
        if (property == nullptr) {
            return false;
        }
        property->getValue(value);
        return true;
    });
}

void ZELServerPropertyAccessor::setProperty(const IZELServerString& category, const IZELServerString& name,
                                            const IZELServerString& value)
{
    guarded([&] {
        const std::string categoryText = toStdString(category);
        const std::string nameText = toStdString(name);
        Category& properties = categories_[categoryText];
        const auto found = properties.find(nameText);
        if (found != properties.end()) {
            found->second.setValue(toStdString(value));
        } else {
            properties.emplace(nameText, ZELServerProperty(categoryText, nameText, toStdString(value)));
        }
    });
}

bool ZELServerPropertyAccessor::removeCategory(const IZELServerString& category)
{
    return guarded([&] { return categories_.erase(toStdString(category)) != 0; });
}

bool ZELServerPropertyAccessor::removeProperty(const IZELServerString& category, const IZELServerString& name)
{
    return guarded([&] {
        const auto found = categories_.find(toStdString(category));
        return found != categories_.end() && found->second.erase(toStdString(name)) != 0;
    });
}

void ZELServerPropertyAccessor::getProperties(const IZELServerString& category,
                                              IZELServerVector<IZELServerProperty>& properties) const
{
    guarded([&] {
        if (const Category* found = findCategory(category)) {
            for (const auto& entry : *found) {
                properties.append(new ZELServerProperty(entry.second));
            }
        }
    });
}

const IZELServerProperty* ZELServerPropertyAccessor::getProperty(const IZELServerString& category,
                                                                 const IZELServerString& name) const
{
    return guarded([&]() -> const IZELServerProperty* {
        const Category* properties = findCategory(category);
        if (properties == nullptr) {
            return nullptr;
        }
        const auto found = properties->find(toStdString(name));
        return found == properties->end() ? nullptr : &found->second;
    });
}

void ZELServerPropertyAccessor::readProperties(const std::vector<XmlElement*>& elements)
{
    for (const XmlElement* element : elements) {
        std::string category = attributeText(*element, "category");
        std::string name = attributeText(*element, "name");
        std::string value = attributeText(*element, "value");
        const ZELServerProperty::Attributes attributes = attributesOf(*element);
        Category& properties = categories_[category];
        const auto found = properties.find(name);
        if (found != properties.end()) {
            found->second.setValue(std::move(value));
            found->second.setAttributes(attributes);
        } else {
            properties.emplace(name, ZELServerProperty(std::move(category), name, std::move(value), attributes));
        }
    }
}

void ZELServerPropertyAccessor::readPropertiesOf(const XmlElement& owner)
{
    readProperties(childElements(&owner, "PROPERTY"));
}

// ---- Writing ----------------------------------------------------------------------------------------

unsigned PropertyAccessorXml::writeXml(XmlDocument& document) const
{
    XmlElement* root = document.documentElement();
    if (root == nullptr) {
        return msg::kXmlFailure;
    }
    ZELServerStringArray categories;
    accessor_.getCategoryNames(categories);
    for (const std::string& category : categories.items()) {
        PropertyVector properties;
        accessor_.getProperties(ZELServerString(category), properties);
        for (unsigned i = 0; i < properties.entries(); ++i) {
            if (!writeProperty(document, *root, category, *properties.at(i))) {
                return msg::kXmlFailure;
            }
        }
    }
    return 0;
}

}  // namespace zel
