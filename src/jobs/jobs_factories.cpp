#include "jobs/jobs_factories.h"

#include "jobs/ZELServerLogFileInfo.h"
#include "jobs/ZELServerTransformationManager.h"
#include "jobs/ZELServerTransformationRequest.h"
#include "jobs/ZELServerTransformationResult.h"

namespace zel {

IZELServerTransformationRequest* makeTransformationRequest(const IZELServerString& keyword,
                                                           const IZELServerString& repository,
                                                           const IZELServerWorkspace& workspace)
{
    return new ZELServerTransformationRequest(keyword, repository, workspace);
}

IZELServerTransformationRequest* makeTransformationRequest(const IZELServerString& keyword,
                                                           const IZELServerString& repository,
                                                           const IZELServerString& workspace)
{
    return new ZELServerTransformationRequest(keyword, repository, workspace);
}

IZELServerTransformationRequest* makeTransformationRequest(const IZELServerString& keyword,
                                                           const IZELServerString& workspacePath)
{
    return new ZELServerTransformationRequest(keyword, workspacePath);
}

IZELServerTransformationResult* makeTransformationResult() { return new ZELServerTransformationResult(); }

IZELServerTransformationResult* makeTransformationResult(const IZELServerString& text)
{
    auto* result = new ZELServerTransformationResult();
    if (result != nullptr) {
        result->parse(text);
    }
    return result;
}

IZELServerLogFileInfo* makeLogFileInfo() { return new ZELServerLogFileInfo(); }

IZELServerTransformationManager* makeTransformationManager(IZELServerChannel* channel)
{
    if (channel == nullptr) {
        return nullptr;
    }
    return new ZELServerTransformationManager(channel);
}

}  // namespace zel
