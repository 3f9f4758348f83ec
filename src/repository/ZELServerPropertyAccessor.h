#pragma once
// Categorised properties: category -> name -> property, both levels in byte order of the names.
// Read from "PROPERTY" elements (attributes "category", "name", "value"; each "ATTRIBUTE" child gives
// one named attribute with "name" and "value") and written back the same way by the four
// property-accessor update commands.

#include <map>
#include <string>
#include <vector>

#include <zelserverapi/IZELServerProperty.h>
#include <zelserverapi/IZELServerPropertyAccessor.h>

#include "api/heap.h"
#include "transport/IZELServerRequest.h"
#include "transport/xml_document.h"

namespace zel {

class ZELServerProperty final : public IZELServerProperty, public HeapObject {
public:
    using Attributes = std::map<std::string, std::string>;

    ZELServerProperty() = default;
    ZELServerProperty(std::string category, std::string name, std::string value, Attributes attributes = {});
    ZELServerProperty(const ZELServerProperty& other);
    ZELServerProperty& operator=(const ZELServerProperty&) = delete;
    ~ZELServerProperty() override = default;

    void getCategory(IZELServerString& out) const override;
    void getName(IZELServerString& out) const override;
    void getValue(IZELServerString& out) const override;
    bool getAttribute(const IZELServerString& name, IZELServerString& value) const override;
    void getAttributes(IZELServerStringArray& pairs) const override;

    const std::string& value() const { return value_; }
    void setValue(std::string value) { value_ = std::move(value); }
    // Sets each attribute, keeping those the given set does not name.
    void setAttributes(const Attributes& attributes);

private:
    std::string category_;
    std::string name_;
    std::string value_;
    Attributes attributes_;
};

class ZELServerPropertyAccessor final : public IZELServerPropertyAccessor, public HeapObject {
public:
    ZELServerPropertyAccessor() = default;
    ZELServerPropertyAccessor(const ZELServerPropertyAccessor&) = delete;
    ZELServerPropertyAccessor& operator=(const ZELServerPropertyAccessor&) = delete;
    ~ZELServerPropertyAccessor() override = default;

    void getCategoryNames(IZELServerStringArray& names) const override;
    void getPropertyNames(const IZELServerString& category, IZELServerStringArray& names) const override;
    bool getPropertyPairs(const IZELServerString& category, IZELServerStringArray& pairs) const override;
    bool getPropertyValue(const IZELServerString& category, const IZELServerString& name,
                          IZELServerString& value) const override;
    void setProperty(const IZELServerString& category, const IZELServerString& name,
                     const IZELServerString& value) override;
    bool removeCategory(const IZELServerString& category) override;
    bool removeProperty(const IZELServerString& category, const IZELServerString& name) override;
    void getProperties(const IZELServerString& category,
                       IZELServerVector<IZELServerProperty>& properties) const override;
    const IZELServerProperty* getProperty(const IZELServerString& category,
                                          const IZELServerString& name) const override;

    // Forgets every property.
    void clear() { categories_.clear(); }
    // Takes in the given "PROPERTY" elements in order. A property that is already there (same
    // category and name) gets the later value, and the later attributes set over its own.
    void readProperties(const std::vector<XmlElement*>& elements);
    // The "PROPERTY" children of `owner` (a service, workspace, dataset or feature type element).
    // Only direct children count: a workspace's element also holds its datasets' properties.
    void readPropertiesOf(const XmlElement& owner);

private:
    using Category = std::map<std::string, ZELServerProperty>;

    const Category* findCategory(const IZELServerString& category) const;

    std::map<std::string, Category> categories_;
};

// Writes any accessor (the library's or a caller's own) as "PROPERTY" elements below the document's
// root, categories and names in the order the accessor lists them, for addXmlValue.
class PropertyAccessorXml final : public XmlWritable {
public:
    explicit PropertyAccessorXml(const IZELServerPropertyAccessor& accessor) : accessor_(accessor) {}
    unsigned writeXml(XmlDocument& document) const override;

private:
    const IZELServerPropertyAccessor& accessor_;
};

}  // namespace zel
