#pragma once
// Workspace descriptions ("WORKSPACE_DEFINITIONS") with their datasets ("DATASET"), feature types
// ("FEATURE_TYPE"), attributes, published parameters, properties and resources. The three kinds that
// carry properties keep the channel, because each sends its own property-accessor update.
//
// Contained objects are read from the direct children of their owner's element: a property's
// "ATTRIBUTE" children are not feature type attributes, and a dataset's "PROPERTY" elements are not
// the workspace's.

#include <cstdint>
#include <string>

#include <zelserverapi/IZELServerDataset.h>
#include <zelserverapi/IZELServerFeatureType.h>
#include <zelserverapi/IZELServerWorkspace.h>

#include "api/ZELServerVector.h"
#include "api/heap.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "repository/repository_objects.h"
#include "transport/IZELServerChannel.h"
#include "transport/xml_document.h"

namespace zel {

struct FeatureTypeFields {
    std::string id;
    std::string name;
    std::string description;
};

class ZELServerFeatureType final : public IZELServerFeatureType, public HeapObject {
public:
    // `channel` is borrowed (null: updatePropertyAccessor fails with 393622).
    explicit ZELServerFeatureType(IZELServerChannel* channel) : channel_(channel) {}
    ZELServerFeatureType(const ZELServerFeatureType&) = delete;
    ZELServerFeatureType& operator=(const ZELServerFeatureType&) = delete;
    ~ZELServerFeatureType() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    IZELServerVector<IZELServerAttribute>& getAttributes() override { return attributes_; }
    IZELServerPropertyAccessor& getPropertyAccessor() override { return properties_; }
    // "REP_UPDATE_FEATURETYPEPROPERTYACCESSOR" with "featureTypeID".
    IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) override;

    // From a "FEATURE_TYPE" element. False only when memory runs out.
    bool readFrom(const XmlElement& element);

private:
    IZELServerChannel* channel_;
    FeatureTypeFields fields_;
    ZELServerVector<IZELServerAttribute, ZELServerAttribute> attributes_;
    ZELServerPropertyAccessor properties_;
};

struct DatasetFields {
    std::string id;
    std::string format;
    std::string name;
    std::string location;
    bool isSource = false;
};

class ZELServerDataset final : public IZELServerDataset, public HeapObject {
public:
    explicit ZELServerDataset(IZELServerChannel* channel) : channel_(channel) {}
    ZELServerDataset(const ZELServerDataset&) = delete;
    ZELServerDataset& operator=(const ZELServerDataset&) = delete;
    ~ZELServerDataset() override = default;

    void getName(IZELServerString& out) const override;
    IZELServerVector<IZELServerFeatureType>& getFeatureTypes() override { return featureTypes_; }
    void getFormat(IZELServerString& out) const override;
    void getLocation(IZELServerString& out) const override;
    bool isSource() const override { return fields_.isSource; }
    IZELServerPropertyAccessor& getPropertyAccessor() override { return properties_; }
    // "REP_UPDATE_DATASETPROPERTYACCESSOR" with "datasetID".
    IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) override;

    // From a "DATASET" element, its feature types on the same channel. False only when memory runs out.
    bool readFrom(const XmlElement& element);

private:
    IZELServerChannel* channel_;
    DatasetFields fields_;
    ZELServerVector<IZELServerFeatureType, ZELServerFeatureType> featureTypes_;
    ZELServerPropertyAccessor properties_;
};

struct WorkspaceFields {
    std::string id;
    std::string name;
    std::string title;
    std::string description;
    bool enabled = false;
    std::int64_t fileSize = 0;
};

class ZELServerWorkspace final : public IZELServerWorkspace, public HeapObject {
public:
    explicit ZELServerWorkspace(IZELServerChannel* channel) : channel_(channel) {}
    ZELServerWorkspace(const ZELServerWorkspace&) = delete;
    ZELServerWorkspace& operator=(const ZELServerWorkspace&) = delete;
    ~ZELServerWorkspace() override = default;

    void getName(IZELServerString& out) const override;
    void getTitle(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;
    bool isEnabled() const override { return fields_.enabled; }
    IZELServerVector<IZELServerParameter>& getParameters() override { return parameters_; }
    IZELServerVector<IZELServerDataset>& getSourceDatasets() override { return sourceDatasets_; }
    IZELServerVector<IZELServerDataset>& getDestinationDatasets() override { return destinationDatasets_; }
    IZELServerVector<IZELServerFeatureType>& getSourceFeatureTypes() override { return sourceFeatureTypes_; }
    IZELServerVector<IZELServerFeatureType>& getDestinationFeatureTypes() override { return destinationFeatureTypes_; }
    IZELServerPropertyAccessor& getPropertyAccessor() override { return properties_; }
    IZELServerVector<IZELServerResource>& getResources() override { return resources_; }
    // "REP_UPDATE_WORKSPACEPROPERTYACCESSOR" with "workspaceID".
    IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) override;
    long long getFileSize() const override { return fields_.fileSize; }

    // Binds the workspace (and what it reads afterwards) to the channel of the reply it is read from.
    void bindTo(IZELServerChannel* channel) { channel_ = channel; }
    // Replaces everything from a "WORKSPACE_DEFINITIONS" element. False only when memory runs out.
    bool readFrom(const XmlElement& element);

private:
    bool readDatasets(const XmlElement& element);

    IZELServerChannel* channel_;
    WorkspaceFields fields_;
    // The datasets own the feature types that the two borrowed lists show; declared first, they
    // are destroyed last.
    ZELServerVector<IZELServerDataset, ZELServerDataset> sourceDatasets_;
    ZELServerVector<IZELServerDataset, ZELServerDataset> destinationDatasets_;
    BorrowedVector<IZELServerFeatureType> sourceFeatureTypes_;
    BorrowedVector<IZELServerFeatureType> destinationFeatureTypes_;
    ZELServerVector<IZELServerParameter, ZELServerParameter> parameters_;
    ZELServerPropertyAccessor properties_;
    ZELServerVector<IZELServerResource, ZELServerResource> resources_;
};

}  // namespace zel
