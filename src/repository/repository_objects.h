#pragma once
// The plain value objects of a repository's views: workspace summaries, feature type attributes,
// published parameters, items, custom formats, custom transformers, templates and resources. Each is
// a field record read once from its element by readFrom (a table of attribute bindings, see
// attribute_binding.h) and handed out read-only. readFrom replaces every field and never refuses an
// element; it returns true so that it serves as the response's fill function.

#include <cstdint>
#include <string>
#include <string_view>

#include <zelserverapi/IZELServerAttribute.h>
#include <zelserverapi/IZELServerCustomFormat.h>
#include <zelserverapi/IZELServerCustomTransformer.h>
#include <zelserverapi/IZELServerItem.h>
#include <zelserverapi/IZELServerParameter.h>
#include <zelserverapi/IZELServerResource.h>
#include <zelserverapi/IZELServerTemplate.h>
#include <zelserverapi/IZELServerWorkspaceSummary.h>

#include "api/heap.h"
#include "transport/xml_document.h"

namespace zel {

// Item types, told by the end of an item's name.
inline constexpr unsigned kOtherItemType = 0;
inline constexpr unsigned kWorkspaceItemType = 1;
inline constexpr unsigned kCustomFormatItemType = 2;
inline constexpr unsigned kCustomTransformerItemType = 3;
inline constexpr unsigned kTemplateItemType = 4;

// ".zlw" 1, ".zds" 2, ".zlx" 3, ".zlwt" 4, compared case-sensitively; anything else 0.
unsigned itemTypeOf(std::string_view itemName);

struct WorkspaceSummaryFields {
    std::string name;
    std::string title;
    std::string description;
    bool enabled = false;
};

class ZELServerWorkspaceSummary final : public IZELServerWorkspaceSummary, public HeapObject {
public:
    ZELServerWorkspaceSummary() = default;
    ZELServerWorkspaceSummary(const ZELServerWorkspaceSummary&) = delete;
    ZELServerWorkspaceSummary& operator=(const ZELServerWorkspaceSummary&) = delete;
    ~ZELServerWorkspaceSummary() override = default;

    void getName(IZELServerString& out) const override;
    void getTitle(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    bool isEnabled() const override { return fields_.enabled; }

    // From a "WORKSPACE_SUMMARY" element.
    bool readFrom(const XmlElement& element);

private:
    WorkspaceSummaryFields fields_;
};

struct AttributeFields {
    std::string name;
    std::string type;
    std::int32_t decimals = 0;
    std::int32_t width = 0;
};

class ZELServerAttribute final : public IZELServerAttribute, public HeapObject {
public:
    ZELServerAttribute() = default;
    ZELServerAttribute(const ZELServerAttribute&) = delete;
    ZELServerAttribute& operator=(const ZELServerAttribute&) = delete;
    ~ZELServerAttribute() override = default;

    void getName(IZELServerString& out) const override;
    void getType(IZELServerString& out) const override;
    int getDecimals() const override { return fields_.decimals; }
    int getWidth() const override { return fields_.width; }

    // From an "ATTRIBUTE" element of a feature type.
    bool readFrom(const XmlElement& element);

private:
    AttributeFields fields_;
};

struct ParameterFields {
    std::string name;
    std::string type;
    std::string defaultValue;
    std::string description;
    std::string optionsType;
    std::string options;
};

class ZELServerParameter final : public IZELServerParameter, public HeapObject {
public:
    ZELServerParameter() = default;
    ZELServerParameter(const ZELServerParameter&) = delete;
    ZELServerParameter& operator=(const ZELServerParameter&) = delete;
    ~ZELServerParameter() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    void getDefaultValue(IZELServerString& out) const override;
    void getType(IZELServerString& out) const override;
    void getOptions(IZELServerStringArray& choices) const override;
    void getOptionsText(IZELServerString& out) const override;
    void getOptionsType(IZELServerString& out) const override;

    // From a "PARAMETER" element.
    bool readFrom(const XmlElement& element);

private:
    ParameterFields fields_;
};

struct ItemFields {
    std::string name;
    std::string repositoryName;
    std::string title;
    std::string description;
    std::int32_t fileSize = 0;
    std::string category;
    std::string requirements;
    std::string requirementsKeyword;
    std::string usage;
    std::string history;
    std::string lastSaveDate;
    std::string lastSaveBuild;
    std::int32_t buildNumber = 0;
    std::string legalTermsAndConditions;
};

class ZELServerItem final : public IZELServerItem, public HeapObject {
public:
    ZELServerItem() = default;
    ZELServerItem(const ZELServerItem&) = delete;
    ZELServerItem& operator=(const ZELServerItem&) = delete;
    ~ZELServerItem() override = default;

    void getName(IZELServerString& out) const override;
    void getRepositoryName(IZELServerString& out) const override;
    unsigned getItemType() const override { return itemType_; }
    void getTitle(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    int getFileSize() const override { return fields_.fileSize; }
    void getCategory(IZELServerString& out) const override;
    void getRequirements(IZELServerString& out) const override;
    void getRequirementsKeyword(IZELServerString& out) const override;
    void getUsage(IZELServerString& out) const override;
    void getHistory(IZELServerString& out) const override;
    void getLastSaveDate(IZELServerString& out) const override;
    void getLastSaveBuild(IZELServerString& out) const override;
    int getBuildNumber() const override { return fields_.buildNumber; }
    void getLegalTermsAndConditions(IZELServerString& out) const override;

    // From an "ITEM" element; the item type follows from the name read.
    bool readFrom(const XmlElement& element);

private:
    ItemFields fields_;
    unsigned itemType_ = kOtherItemType;
};

// Custom formats, custom transformers and templates are one record under three tags; the server
// gives custom transformers no title, so their title stays empty.
struct StoredFileFields {
    std::string name;
    std::string title;
    std::string description;
    std::int64_t fileSize = 0;
};

class ZELServerCustomFormat final : public IZELServerCustomFormat, public HeapObject {
public:
    ZELServerCustomFormat() = default;
    ZELServerCustomFormat(const ZELServerCustomFormat&) = delete;
    ZELServerCustomFormat& operator=(const ZELServerCustomFormat&) = delete;
    ~ZELServerCustomFormat() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    long long getFileSize() const override { return fields_.fileSize; }
    void getTitle(IZELServerString& out) const override;
    unsigned getItemType() const override { return kCustomFormatItemType; }

    // From a "CUSTOMFORMAT" element.
    bool readFrom(const XmlElement& element);

private:
    StoredFileFields fields_;
};

class ZELServerCustomTransformer final : public IZELServerCustomTransformer, public HeapObject {
public:
    ZELServerCustomTransformer() = default;
    ZELServerCustomTransformer(const ZELServerCustomTransformer&) = delete;
    ZELServerCustomTransformer& operator=(const ZELServerCustomTransformer&) = delete;
    ~ZELServerCustomTransformer() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    long long getFileSize() const override { return fields_.fileSize; }
    void getTitle(IZELServerString& out) const override;
    unsigned getItemType() const override { return kCustomTransformerItemType; }

    // From a "CUSTOMTRANSFORMER" element.
    bool readFrom(const XmlElement& element);

private:
    StoredFileFields fields_;
};

class ZELServerTemplate final : public IZELServerTemplate, public HeapObject {
public:
    ZELServerTemplate() = default;
    ZELServerTemplate(const ZELServerTemplate&) = delete;
    ZELServerTemplate& operator=(const ZELServerTemplate&) = delete;
    ~ZELServerTemplate() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    long long getFileSize() const override { return fields_.fileSize; }
    void getTitle(IZELServerString& out) const override;
    unsigned getItemType() const override { return kTemplateItemType; }

    // From a "TEMPLATE" element.
    bool readFrom(const XmlElement& element);

private:
    StoredFileFields fields_;
};

struct ResourceFields {
    std::string name;
    std::string description;
    std::int32_t fileSize = 0;
};

class ZELServerResource final : public IZELServerResource, public HeapObject {
public:
    ZELServerResource() = default;
    ZELServerResource(const ZELServerResource&) = delete;
    ZELServerResource& operator=(const ZELServerResource&) = delete;
    ~ZELServerResource() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    int getFileSize() const override { return fields_.fileSize; }

    // From a "RESOURCE" element.
    bool readFrom(const XmlElement& element);

private:
    ResourceFields fields_;
};

}  // namespace zel
