#pragma once
// The description of one workspace in a repository ("WORKSPACE_DEFINITIONS"): its datasets, feature
// types, published parameters, properties and resources. Made by IZELServerSession::createWorkspace
// (or by a list, whose vector owns it) and destroyed by the matching session operation; filled by
// IZELServerRepository::getWorkspaceView or getWorkspacesView. Read-only apart from its properties;
// missing attributes read as empty text, false or 0.
//
// The collections and the accessor handed out belong to the workspace and live as long as it does:
// never destroy them, and never remove or destroy their elements. The feature type collections borrow
// their elements from the datasets.

#include "IZELServerDataset.h"
#include "IZELServerFeatureType.h"
#include "IZELServerParameter.h"
#include "IZELServerPropertyAccessor.h"
#include "IZELServerResource.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"

class IZELServerWorkspace {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getTitle(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    virtual bool isEnabled() const = 0;
    // Published parameters, in document order.
    virtual IZELServerVector<IZELServerParameter>& getParameters() = 0;
    // The datasets split by their source flag, each in reverse document order.
    virtual IZELServerVector<IZELServerDataset>& getSourceDatasets() = 0;
    virtual IZELServerVector<IZELServerDataset>& getDestinationDatasets() = 0;
    // The feature types of the source (destination) datasets, dataset by dataset in the order above.
    virtual IZELServerVector<IZELServerFeatureType>& getSourceFeatureTypes() = 0;
    virtual IZELServerVector<IZELServerFeatureType>& getDestinationFeatureTypes() = 0;
    // The workspace's own properties; edit them here and send them with updatePropertyAccessor.
    virtual IZELServerPropertyAccessor& getPropertyAccessor() = 0;
    // Resources attached to the workspace, in document order.
    virtual IZELServerVector<IZELServerResource>& getResources() = 0;
    // Sends `accessor` as the workspace's properties ("REP_UPDATE_WORKSPACEPROPERTYACCESSOR"). Null,
    // or the exchange's status. The workspace must come from a session that is still connected as it
    // was when the workspace was made.
    virtual IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) = 0;
    // Size in bytes as the server reported it.
    virtual long long getFileSize() const = 0;
    virtual ~IZELServerWorkspace() = default;

protected:
    IZELServerWorkspace() = default;
    IZELServerWorkspace(const IZELServerWorkspace&) = default;
    IZELServerWorkspace& operator=(const IZELServerWorkspace&) = default;
};
