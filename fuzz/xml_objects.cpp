// Every object reader of a response, as a reply body reaches it: the first byte picks the reader,
// the rest is the body.
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

#include <zelserverapi/IZELServerIdentity.h>
#include <zelserverapi/ZELServerStringDict.h>

#include "jobs/jobs_factories.h"
#include "repository/repository_factories.h"
#include "repository/repository_objects.h"
#include "security/ZELServerUserToken.h"
#include "sharedresources/sharedresources_factories.h"
#include "transport/ZELServerResponse.h"
#include "transport/xml_platform.h"

namespace {

using namespace zel;
using Response = const ZELServerResponse&;

template <typename Object, typename Target>
void readInto(Object* object, int (ZELServerResponse::*reader)(Target&) const, Response response)
{
    std::unique_ptr<Object> owned(object);
    (response.*reader)(*owned);
}

void readSessionInit(Response response)
{
    IZELServerIdentity* identity = nullptr;
    ZELServerStringDict settings;
    response.readSessionInit(identity, settings);
    delete identity;
}

using R = ZELServerResponse;
void (*const kReaders[])(Response) = {
    readSessionInit,
    [](Response r) { readInto(makeWorkspaceSummary(), &R::readWorkspaceSummary, r); },
    [](Response r) { readInto(makeWorkspace(nullptr), &R::readWorkspace, r); },
    [](Response r) { readInto(makeWorkspaceVector(), &R::readWorkspaces, r); },
    [](Response r) { readInto(makeCustomFormat(), &R::readCustomFormat, r); },
    [](Response r) { readInto(makeCustomFormatVector(), &R::readCustomFormats, r); },
    [](Response r) { readInto(makeCustomTransformer(), &R::readCustomTransformer, r); },
    [](Response r) { readInto(makeCustomTransformerVector(), &R::readCustomTransformers, r); },
    [](Response r) { readInto(makeResource(), &R::readResource, r); },
    [](Response r) { readInto(makeResourceVector(), &R::readResources, r); },
    [](Response r) { readInto(makeWorkspaceService(nullptr), &R::readWorkspaceService, r); },
    [](Response r) { readInto(makeService(nullptr), &R::readService, r); },
    [](Response r) { readInto(makeServiceVector(), &R::readServices, r); },
    [](Response r) { readInto(makeRepository(nullptr), &R::readRepository, r); },
    [](Response r) { readInto(makeRepositoryVector(), &R::readRepositories, r); },
    [](Response r) { readInto(makeLogFileInfo(), &R::readLogFileInfo, r); },
    [](Response r) { readInto(makeTemplate(), &R::readTemplate, r); },
    [](Response r) { readInto(makeTemplateVector(), &R::readTemplates, r); },
    [](Response r) { readInto(new ZELServerItem, &R::readItem, r); },
    [](Response r) { readInto(new ZELServerUserToken, &R::readUserToken, r); },
    [](Response r) { readInto(makeMountPoint(nullptr), &R::readMountPoint, r); },
    [](Response r) { readInto(makeMountPointVector(), &R::readMountPoints, r); },
    [](Response r) { readInto(makeFileInfo(), &R::readFileInfo, r); },
    [](Response r) { readInto(makeFileInfoVector(), &R::readFileInfos, r); },
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    // A session keeps the XML library started for its whole life; so does this process.
    static XmlPlatformRef xml;
    if (!xml.held())
        delete xml.acquire();
    if (size == 0)
        return 0;
    ZELServerResponse response(nullptr);
    response.setBody(std::string(reinterpret_cast<const char*>(data) + 1, size - 1));
    kReaders[data[0] % std::size(kReaders)](response);
    return 0;
}
