#pragma once
// One feature type of a dataset ("FEATURE_TYPE"), owned by its IZELServerDataset (a workspace's feature
// type collections only borrow it). Read-only apart from its properties; missing attributes read as
// empty text.

#include "IZELServerAttribute.h"
#include "IZELServerPropertyAccessor.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"

class IZELServerFeatureType {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    // The feature type's own attributes, in document order. They belong to the feature type: do not
    // destroy or remove them.
    virtual IZELServerVector<IZELServerAttribute>& getAttributes() = 0;
    // The feature type's own properties; edit them here and send them with updatePropertyAccessor.
    virtual IZELServerPropertyAccessor& getPropertyAccessor() = 0;
    // Sends `accessor` as the feature type's properties ("REP_UPDATE_FEATURETYPEPROPERTYACCESSOR").
    // Null, or the exchange's status. The feature type must come from a session that is still
    // connected as it was when the feature type was read.
    virtual IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) = 0;
    virtual ~IZELServerFeatureType() = default;

protected:
    IZELServerFeatureType() = default;
    IZELServerFeatureType(const IZELServerFeatureType&) = default;
    IZELServerFeatureType& operator=(const IZELServerFeatureType&) = default;
};
