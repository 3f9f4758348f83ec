#pragma once
// Every public interface of the library in one include. The entry points themselves are declared in
// zelserverapi.h.

// Values, statuses and the session.
#include "IZELServerString.h"
#include "IZELServerStringArray.h"
#include "IZELServerVector.h"
#include "ZELServerStringDict.h"
#include "IZELServerStatus.h"
#include "IZELServerConnectionInfo.h"
#include "IZELServerIdentity.h"
#include "IZELServerProgressListener.h"
#include "IZELLogSink.h"
#include "IZELServerSession.h"

// Jobs.
#include "IZELServerTransformationManager.h"
#include "IZELServerTransformationRequest.h"
#include "IZELServerTransformationResult.h"
#include "IZELServerLogFileInfo.h"

// Repositories and services.
#include "IZELServerRepositoryManager.h"
#include "IZELServerRepository.h"
#include "IZELServerWorkspace.h"
#include "IZELServerWorkspaceSummary.h"
#include "IZELServerDataset.h"
#include "IZELServerFeatureType.h"
#include "IZELServerAttribute.h"
#include "IZELServerParameter.h"
#include "IZELServerItem.h"
#include "IZELServerCustomFormat.h"
#include "IZELServerCustomTransformer.h"
#include "IZELServerTemplate.h"
#include "IZELServerResource.h"
#include "IZELServerService.h"
#include "IZELServerWorkspaceService.h"
#include "IZELServerPropertyAccessor.h"
#include "IZELServerProperty.h"

// Security.
#include "IZELServerSecurityManager.h"
#include "IZELServerUserToken.h"

// Shared resources.
#include "IZELServerMountPointManager.h"
#include "IZELServerMountPoint.h"
#include "IZELServerFileInfo.h"
#include "IZELServerPath.h"
