#pragma once
// One source or destination dataset of a workspace ("DATASET"), owned by its IZELServerWorkspace.
// Read-only apart from its properties; missing attributes read as empty text or false.

#include "IZELServerFeatureType.h"
#include "IZELServerPropertyAccessor.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"

class IZELServerDataset {
public:
    virtual void getName(IZELServerString& out) const = 0;
    // The dataset's feature types, in document order. They belong to the dataset: do not destroy or
    // remove them.
    virtual IZELServerVector<IZELServerFeatureType>& getFeatureTypes() = 0;
    virtual void getFormat(IZELServerString& out) const = 0;
    virtual void getLocation(IZELServerString& out) const = 0;
    // True for a source dataset, false for a destination.
    virtual bool isSource() const = 0;
    // The dataset's own properties; edit them here and send them with updatePropertyAccessor.
    virtual IZELServerPropertyAccessor& getPropertyAccessor() = 0;
    // Sends `accessor` as the dataset's properties ("REP_UPDATE_DATASETPROPERTYACCESSOR"). Null, or
    // the exchange's status. The dataset must come from a session that is still connected as it was
    // when the dataset was read.
    virtual IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) = 0;
    virtual ~IZELServerDataset() = default;

protected:
    IZELServerDataset() = default;
    IZELServerDataset(const IZELServerDataset&) = default;
    IZELServerDataset& operator=(const IZELServerDataset&) = default;
};
