#include "repository/ZELServerWorkspace.h"

#include <memory>
#include <vector>

#include "api/exception_guard.h"
#include "transport/attribute_binding.h"
#include "repository/repository_checks.h"
#include "api/ZELServerString.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

constexpr AttributeBinding<FeatureTypeFields> kFeatureTypeAttributes[] = {
    {"feature_type_id", &FeatureTypeFields::id},
    {"name", &FeatureTypeFields::name},
    {"description", &FeatureTypeFields::description},
};

constexpr AttributeBinding<DatasetFields> kDatasetAttributes[] = {
    {"dataset_id", &DatasetFields::id},     {"format", &DatasetFields::format},      {"name", &DatasetFields::name},
    {"location", &DatasetFields::location}, {"is_source", &DatasetFields::isSource},
};

constexpr AttributeBinding<WorkspaceFields> kWorkspaceAttributes[] = {
    {"workspace_id", &WorkspaceFields::id},    {"name", &WorkspaceFields::name},
    {"title", &WorkspaceFields::title},        {"description", &WorkspaceFields::description},
    {"is_enabled", &WorkspaceFields::enabled}, {"filesize", &WorkspaceFields::fileSize},
};

// Replaces the contents of `out` with one object per direct child named `tag`, in document order.
template <class I, class C, class Make>
bool readChildren(const XmlElement& parent, const char* tag, ZELServerVector<I, C>& out, Make make)
{
    out.clearAndDestroy();
    for (const XmlElement* child : childElements(&parent, tag)) {
        std::unique_ptr<C> object(make());
        if (object == nullptr || !object->readFrom(*child)) {
            return false;
        }
        out.append(object.release());
    }
    return true;
}

void appendFeatureTypes(IZELServerVector<IZELServerDataset>& datasets, IZELServerVector<IZELServerFeatureType>& out)
{
    for (unsigned i = 0; i < datasets.entries(); ++i) {
        IZELServerVector<IZELServerFeatureType>& featureTypes = datasets.element(i)->getFeatureTypes();
        for (unsigned j = 0; j < featureTypes.entries(); ++j) {
            appendOrThrow(out, featureTypes.element(j));
        }
    }
}

// The three property-accessor updates differ only in keyword and id name; the document's root is
// named after the command.
IZELServerStatus* sendProperties(IZELServerChannel* channel, const char* keyword, const char* idName,
                                 const std::string& id, const IZELServerPropertyAccessor& accessor)
{
    const PropertyAccessorXml properties(accessor);
    return CheckedCommand(channel, keyword)
        .add(idName, id)
        .addXml("propertyAccessorObject", properties, keyword)
        .send();
}

}  // namespace

// ---- Feature type -----------------------------------------------------------------------------------

void ZELServerFeatureType::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerFeatureType::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }

IZELServerStatus* ZELServerFeatureType::updatePropertyAccessor(const IZELServerPropertyAccessor& accessor)
{
    return guarded([&] {
        return sendProperties(channel_, "REP_UPDATE_FEATURETYPEPROPERTYACCESSOR", "featureTypeID", fields_.id,
                              accessor);
    });
}

bool ZELServerFeatureType::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kFeatureTypeAttributes);
    properties_.clear();
    properties_.readPropertiesOf(element);
    return readChildren(element, "ATTRIBUTE", attributes_, [] { return new ZELServerAttribute(); });
}

// ---- Dataset ----------------------------------------------------------------------------------------

void ZELServerDataset::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerDataset::getFormat(IZELServerString& out) const { handOutText(fields_.format, out); }
void ZELServerDataset::getLocation(IZELServerString& out) const { handOutText(fields_.location, out); }

IZELServerStatus* ZELServerDataset::updatePropertyAccessor(const IZELServerPropertyAccessor& accessor)
{
    return guarded([&] {
        return sendProperties(channel_, "REP_UPDATE_DATASETPROPERTYACCESSOR", "datasetID", fields_.id, accessor);
    });
}

bool ZELServerDataset::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kDatasetAttributes);
    properties_.clear();
    properties_.readPropertiesOf(element);
    IZELServerChannel* channel = channel_;
    return readChildren(element, "FEATURE_TYPE", featureTypes_,
                        [channel] { return new ZELServerFeatureType(channel); });
}

// ---- Workspace --------------------------------------------------------------------------------------

void ZELServerWorkspace::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerWorkspace::getTitle(IZELServerString& out) const { handOutText(fields_.title, out); }
void ZELServerWorkspace::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }

IZELServerStatus* ZELServerWorkspace::updatePropertyAccessor(const IZELServerPropertyAccessor& accessor)
{
    return guarded([&] {
        return sendProperties(channel_, "REP_UPDATE_WORKSPACEPROPERTYACCESSOR", "workspaceID", fields_.id, accessor);
    });
}

bool ZELServerWorkspace::readDatasets(const XmlElement& element)
{
    std::vector<std::unique_ptr<ZELServerDataset>> datasets;
    for (const XmlElement* child : childElements(&element, "DATASET")) {
        std::unique_ptr<ZELServerDataset> dataset(new ZELServerDataset(channel_));
        if (dataset == nullptr || !dataset->readFrom(*child)) {
            return false;
        }
        datasets.push_back(std::move(dataset));
    }
    // The borrowed lists point into the datasets about to be destroyed.
    sourceFeatureTypes_.clear();
    destinationFeatureTypes_.clear();
    sourceDatasets_.clearAndDestroy();
    destinationDatasets_.clearAndDestroy();
    // Taken off the end, so both lists come out in reverse document order, as the interface promises.
    while (!datasets.empty()) {
        ZELServerDataset* dataset = datasets.back().release();
        datasets.pop_back();
        appendOrThrow<IZELServerDataset>(dataset->isSource() ? sourceDatasets_ : destinationDatasets_, dataset);
    }
    appendFeatureTypes(sourceDatasets_, sourceFeatureTypes_);
    appendFeatureTypes(destinationDatasets_, destinationFeatureTypes_);
    return true;
}

bool ZELServerWorkspace::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kWorkspaceAttributes);
    if (!readDatasets(element) ||
        !readChildren(element, "PARAMETER", parameters_, [] { return new ZELServerParameter(); })) {
        return false;
    }
    properties_.clear();
    properties_.readPropertiesOf(element);
    return readChildren(element, "RESOURCE", resources_, [] { return new ZELServerResource(); });
}

}  // namespace zel
