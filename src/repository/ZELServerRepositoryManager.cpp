#include "repository/ZELServerRepositoryManager.h"

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "repository/ZELServerRepository.h"
#include "repository/repository_checks.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

bool selectsAllItems(const ZELServerStringDict* directives)
{
    const std::string* query = directives != nullptr ? directives->find("GLOBAL") : nullptr;
    return query != nullptr && *query == "ALLITEMS";
}

// The answer is a document of "PROPERTY" elements, one per item, wherever they stand in it.
IZELServerStatus* readGlobalItems(const std::string& body, IZELServerPropertyAccessor& items)
{
    XmlReader reader;
    if (IZELServerStatus* failure = reader.parse(body)) {
        return failure;
    }
    auto* accessor = dynamic_cast<ZELServerPropertyAccessor*>(&items);
    if (reader.rootOf() == nullptr || accessor == nullptr) {
        return makeStatus(msg::kUnreadableReply);
    }
    accessor->readProperties(elementsNamed(reader.rootOf(), "PROPERTY"));
    return nullptr;
}

}  // namespace

// ---- Services ---------------------------------------------------------------------------------------
// Service names are only checked for emptiness: the forbidden characters concern repository names.

IZELServerStatus* ZELServerRepositoryManager::serviceExists(const IZELServerString& serviceName, unsigned& exists)
{
    return guarded([&] {
        return CheckedCommand(channel_, "REP_SERVICEEXISTS")
            .require(serviceName)
            .add("serviceName", serviceName)
            .askFlag(exists);
    });
}

IZELServerStatus* ZELServerRepositoryManager::getServices(const ZELServerStringDict* directives,
                                                          IZELServerVector<IZELServerService>& services)
{
    return guarded([&]() -> IZELServerStatus* {
        const ZELServerStringArray filter = enableFilterList(directives);
        return CheckedCommand(channel_, "REP_GET_SERVICES")
            .require(filter.entries() >= 2)
            .addList("directives", filter)
            .askList([&](const IZELServerResponse& response) { return response.readServices(services); });
    });
}

IZELServerStatus* ZELServerRepositoryManager::getService(const IZELServerString& serviceName,
                                                         IZELServerService& service, unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel_, "REP_GET_SERVICE")
            .require(serviceName)
            .add("serviceName", serviceName)
            .askObject(found, [&](const IZELServerResponse& response) { return response.readService(service); });
    });
}

IZELServerStatus* ZELServerRepositoryManager::addService(const IZELServerService& service)
{
    return guarded(
        [&] { return CheckedCommand(channel_, "REP_ADD_SERVICE").addService("serviceObject", service).send(); });
}

// The payload's root stays "REP_ADD_SERVICE" for the update: the server reads only its "SERVICE".
IZELServerStatus* ZELServerRepositoryManager::updateService(const IZELServerService& service)
{
    return guarded(
        [&] { return CheckedCommand(channel_, "REP_UPDATE_SERVICE").addService("serviceObject", service).send(); });
}

IZELServerStatus* ZELServerRepositoryManager::removeService(const IZELServerString& serviceName, unsigned& removed)
{
    return guarded([&] {
        return CheckedCommand(channel_, "REP_REMOVE_SERVICE")
            .require(serviceName)
            .add("serviceName", serviceName)
            .askFlag(removed);
    });
}

// ---- Repositories -----------------------------------------------------------------------------------

// Only emptiness is checked, unlike the operations below: asking whether a name exists harms nothing.
IZELServerStatus* ZELServerRepositoryManager::repositoryExists(const IZELServerString& repositoryName, unsigned& exists)
{
    return guarded([&] {
        return CheckedCommand(channel_, "REP_REPOSITORYEXISTS")
            .require(repositoryName)
            .add("repositoryName", repositoryName)
            .askFlag(exists);
    });
}

IZELServerStatus* ZELServerRepositoryManager::getRepositories(const ZELServerStringDict* directives,
                                                              IZELServerVector<IZELServerRepository>& repositories)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel_, "REP_GET_REPOSITORIES")
            .require(directives == nullptr)
            .addList("directives", ZELServerStringArray({"enableFilter", "All"}))
            .askList([&](const IZELServerResponse& response) { return response.readRepositories(repositories); });
    });
}

IZELServerStatus* ZELServerRepositoryManager::getRepository(const IZELServerString& repositoryName,
                                                            IZELServerRepository& repository, unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel_, "REP_GET_REPOSITORY")
            .require(repositoryName)
            .check(allowedName(repositoryName))
            .add("repositoryName", repositoryName)
            .askObject(found, [&](const IZELServerResponse& response) { return response.readRepository(repository); });
    });
}

IZELServerStatus* ZELServerRepositoryManager::addRepository(const IZELServerString& repositoryName,
                                                            const IZELServerString& description)
{
    return guarded([&] {
        // The payload is written from a repository object, as every "REPOSITORY" element is.
        const ZELServerRepository repository(channel_, repositoryName, description);
        ZELServerString name;
        ZELServerString text;
        repository.getName(name);
        repository.getDescription(text);
        return CheckedCommand(channel_, "REP_ADD_REPOSITORY")
            .require(repositoryName)
            .check(allowedName(repositoryName))
            .addRepository("repositoryObject", name, text)
            .send();
    });
}

IZELServerStatus* ZELServerRepositoryManager::removeRepository(const IZELServerString& repositoryName,
                                                               unsigned& removed)
{
    return guarded([&] {
        return CheckedCommand(channel_, "REP_REMOVE_REPOSITORY")
            .require(repositoryName)
            .check(allowedName(repositoryName))
            .add("repositoryName", repositoryName)
            .askFlag(removed);
    });
}

// ---- Global query -----------------------------------------------------------------------------------

IZELServerStatus* ZELServerRepositoryManager::getGlobalItems(const ZELServerStringDict* directives,
                                                             IZELServerPropertyAccessor& items)
{
    return guarded([&]() -> IZELServerStatus* {
        // Directives that select no query are not an error: there is simply nothing to ask.
        if (!selectsAllItems(directives)) {
            return nullptr;
        }
        return CheckedCommand(channel_, "REP_GLOBAL_GET_ALL_ITEMS")
            .add("enableFilter", "All")
            .run([&](Command& command) -> IZELServerStatus* {
                if (IZELServerStatus* status = command.send()) {
                    return status;
                }
                return readGlobalItems(command.body(), items);
            });
    });
}

}  // namespace zel
