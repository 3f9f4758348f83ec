#include "repository/repository_objects.h"

#include <zelserverapi/IZELServerStringArray.h>

#include "api/exception_guard.h"
#include "transport/attribute_binding.h"
#include "api/ZELServerString.h"

namespace zel {
namespace {

constexpr AttributeBinding<WorkspaceSummaryFields> kSummaryAttributes[] = {
    {"name", &WorkspaceSummaryFields::name},
    {"title", &WorkspaceSummaryFields::title},
    {"description", &WorkspaceSummaryFields::description},
    {"is_enabled", &WorkspaceSummaryFields::enabled},
};

constexpr AttributeBinding<AttributeFields> kAttributeAttributes[] = {
    {"name", &AttributeFields::name},
    {"zel_type", &AttributeFields::type},
    {"decimals", &AttributeFields::decimals},
    {"width", &AttributeFields::width},
};

constexpr AttributeBinding<ParameterFields> kParameterAttributes[] = {
    {"name", &ParameterFields::name},
    {"param_type", &ParameterFields::type},
    {"default_val", &ParameterFields::defaultValue},
    {"description", &ParameterFields::description},
    {"options_type", &ParameterFields::optionsType},
    {"options", &ParameterFields::options},
};

// Description, requirements, usage, history and the legal terms are long free text. The document's
// text is kept as the UTF-8 bytes the parser gives, which loses nothing, like every other text field.
constexpr AttributeBinding<ItemFields> kItemAttributes[] = {
    {"name", &ItemFields::name},
    {"repository_name", &ItemFields::repositoryName},
    {"title", &ItemFields::title},
    {"description", &ItemFields::description},
    {"filesize", &ItemFields::fileSize},
    {"category", &ItemFields::category},
    {"requirements", &ItemFields::requirements},
    {"requirementskeyword", &ItemFields::requirementsKeyword},
    {"usage", &ItemFields::usage},
    {"history", &ItemFields::history},
    {"lastsavedate", &ItemFields::lastSaveDate},
    {"lastsavebuild", &ItemFields::lastSaveBuild},
    {"buildnumber", &ItemFields::buildNumber},
    {"legaltermsconditions", &ItemFields::legalTermsAndConditions},
};

constexpr AttributeBinding<StoredFileFields> kCustomFormatAttributes[] = {
    {"name", &StoredFileFields::name},
    {"title", &StoredFileFields::title},
    {"description", &StoredFileFields::description},
    {"filesize", &StoredFileFields::fileSize},
};

constexpr AttributeBinding<StoredFileFields> kCustomTransformerAttributes[] = {
    {"name", &StoredFileFields::name},
    {"description", &StoredFileFields::description},
    {"filesize", &StoredFileFields::fileSize},
};

constexpr AttributeBinding<StoredFileFields> kTemplateAttributes[] = {
    {"name", &StoredFileFields::name},
    {"title", &StoredFileFields::title},
    {"description", &StoredFileFields::description},
    {"filesize", &StoredFileFields::fileSize},
};

constexpr AttributeBinding<ResourceFields> kResourceAttributes[] = {
    {"name", &ResourceFields::name},
    {"description", &ResourceFields::description},
    {"filesize", &ResourceFields::fileSize},
};

constexpr std::pair<std::string_view, unsigned> kItemEndings[] = {
    {".zlw", kWorkspaceItemType},
    {".zds", kCustomFormatItemType},
    {".zlx", kCustomTransformerItemType},
    {".zlwt", kTemplateItemType},
};

}  // namespace

unsigned itemTypeOf(std::string_view itemName)
{
    for (const auto& [ending, type] : kItemEndings) {
        if (itemName.ends_with(ending)) {
            return type;
        }
    }
    return kOtherItemType;
}

// ---- Workspace summary ------------------------------------------------------------------------------

void ZELServerWorkspaceSummary::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerWorkspaceSummary::getTitle(IZELServerString& out) const { handOutText(fields_.title, out); }
void ZELServerWorkspaceSummary::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }

bool ZELServerWorkspaceSummary::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kSummaryAttributes);
    return true;
}

// ---- Feature type attribute -------------------------------------------------------------------------

void ZELServerAttribute::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerAttribute::getType(IZELServerString& out) const { handOutText(fields_.type, out); }

bool ZELServerAttribute::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kAttributeAttributes);
    return true;
}

// ---- Published parameter ----------------------------------------------------------------------------

void ZELServerParameter::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerParameter::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }
void ZELServerParameter::getDefaultValue(IZELServerString& out) const { handOutText(fields_.defaultValue, out); }
void ZELServerParameter::getType(IZELServerString& out) const { handOutText(fields_.type, out); }
void ZELServerParameter::getOptionsText(IZELServerString& out) const { handOutText(fields_.options, out); }
void ZELServerParameter::getOptionsType(IZELServerString& out) const { handOutText(fields_.optionsType, out); }

void ZELServerParameter::getOptions(IZELServerStringArray& choices) const
{
    guarded([&] {
        // A file filter is one pattern list that may itself hold "%", so it is never split.
        if (fields_.optionsType == "FILEFILTER_CONFIG") {
            choices.append(fields_.options.c_str());
        } else if (fields_.optionsType == "SINGLECHOICE_CONFIG" || fields_.optionsType == "MULTICHOICE_CONFIG") {
            choices.appendTokens(fields_.options.c_str(), "%");
        }
    });
}

bool ZELServerParameter::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kParameterAttributes);
    return true;
}

// ---- Item -------------------------------------------------------------------------------------------

void ZELServerItem::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerItem::getRepositoryName(IZELServerString& out) const { handOutText(fields_.repositoryName, out); }
void ZELServerItem::getTitle(IZELServerString& out) const { handOutText(fields_.title, out); }
void ZELServerItem::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }
void ZELServerItem::getCategory(IZELServerString& out) const { handOutText(fields_.category, out); }
void ZELServerItem::getRequirements(IZELServerString& out) const { handOutText(fields_.requirements, out); }
void ZELServerItem::getRequirementsKeyword(IZELServerString& out) const
{
    handOutText(fields_.requirementsKeyword, out);
}
void ZELServerItem::getUsage(IZELServerString& out) const { handOutText(fields_.usage, out); }
void ZELServerItem::getHistory(IZELServerString& out) const { handOutText(fields_.history, out); }
void ZELServerItem::getLastSaveDate(IZELServerString& out) const { handOutText(fields_.lastSaveDate, out); }
void ZELServerItem::getLastSaveBuild(IZELServerString& out) const { handOutText(fields_.lastSaveBuild, out); }
void ZELServerItem::getLegalTermsAndConditions(IZELServerString& out) const
{
    handOutText(fields_.legalTermsAndConditions, out);
}

bool ZELServerItem::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kItemAttributes);
    itemType_ = itemTypeOf(fields_.name);
    return true;
}

// ---- Custom format, custom transformer, template ----------------------------------------------------

void ZELServerCustomFormat::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerCustomFormat::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }
void ZELServerCustomFormat::getTitle(IZELServerString& out) const { handOutText(fields_.title, out); }

bool ZELServerCustomFormat::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kCustomFormatAttributes);
    return true;
}

void ZELServerCustomTransformer::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerCustomTransformer::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }
void ZELServerCustomTransformer::getTitle(IZELServerString& out) const { handOutText(fields_.title, out); }

bool ZELServerCustomTransformer::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kCustomTransformerAttributes);
    return true;
}

void ZELServerTemplate::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerTemplate::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }
void ZELServerTemplate::getTitle(IZELServerString& out) const { handOutText(fields_.title, out); }

bool ZELServerTemplate::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kTemplateAttributes);
    return true;
}

// ---- Resource ---------------------------------------------------------------------------------------

void ZELServerResource::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerResource::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }

bool ZELServerResource::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kResourceAttributes);
    return true;
}

}  // namespace zel
