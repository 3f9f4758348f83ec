// The whole round trip of a workspace: uploads a local workspace file into a repository (made when
// missing, the item replaced when present), runs it as a job, waits for the job to end and downloads
// the job's log into a local file.
//
//   publish_and_run HOST PORT USER PASSWORD REPOSITORY WORKSPACE_FILE LOG_FILE [NAME=VALUE]...
//
// The item takes the workspace file's own name. The job service is "zeljob".

#include <cstdio>
#include <cstring>
#include <string>

#include "../common/example_session.h"

namespace {

// The file name of a local path, whichever separator the platform writes.
std::string fileNameOf(const std::string& path)
{
    const std::string::size_type cut = path.find_last_of("/\\");
    return cut == std::string::npos ? path : path.substr(cut + 1);
}

// Opens the repository, adding it first when the server has none of that name.
bool openRepository(example::Session& session, const char* name, IZELServerRepository& repository)
{
    IZELServerRepositoryManager* repositories = session->getRepositoryManager();
    example::Session::String nameText(session, name), description(session, "Made by publish_and_run");
    unsigned found = 0;
    if (!session.succeeded(repositories->getRepository(*nameText, repository, found)))
        return false;
    if (found)
        return true;
    if (!session.succeeded(repositories->addRepository(*nameText, *description)))
        return false;
    std::printf("added repository %s\n", name);
    if (!session.succeeded(repositories->getRepository(*nameText, repository, found)))
        return false;
    return found != 0;
}

// Uploads the file as the item `itemName`, replacing an item of that name.
bool publish(example::Session& session, IZELServerRepository& repository, const std::string& itemName,
             const char* localFile)
{
    example::Session::String item(session, itemName), source(session, localFile);
    unsigned exists = 0;
    if (!session.succeeded(repository.itemExists(*item, exists)))
        return false;
    const bool uploaded = exists ? session.succeeded(repository.updateItem(*item, *source))
                                 : session.succeeded(repository.addItem(*item, *source));
    if (uploaded)
        std::printf("%s item %s\n", exists ? "updated" : "added", itemName.c_str());
    return uploaded;
}

// Submits the item as a job with the NAME=VALUE parameters; the job's number goes to `jobId`.
bool submit(example::Session& session, const char* repository, const std::string& itemName, char** parameters,
            int count, unsigned& jobId)
{
    example::Session::String keyword(session, "zeljob"), repositoryText(session, repository),
        workspace(session, itemName);
    IZELServerTransformationRequest* request =
        session->createTransformationRequest(*keyword, *repositoryText, *workspace);
    bool good = request != nullptr;
    for (int i = 0; good && i < count; ++i) {
        const char* equals = std::strchr(parameters[i], '=');
        if (equals == nullptr || equals == parameters[i]) {
            std::fprintf(stderr, "error: parameter '%s' is not NAME=VALUE\n", parameters[i]);
            good = false;
            break;
        }
        example::Session::String name(session, std::string(parameters[i], static_cast<std::size_t>(equals - parameters[i]))),
            value(session, equals + 1);
        request->setPublishedParameter(*name, *value);
    }
    if (good)
        good = session.succeeded(session->getTransformationManager()->submitJob(*request, jobId));
    session->destroyTransformationRequest(&request);
    if (good)
        std::printf("submitted job %u\n", jobId);
    return good;
}

// Waits for the job and prints how it ended; true when it succeeded.
bool awaitSuccess(example::Session& session, unsigned jobId)
{
    IZELServerTransformationResult* result = session->createTransformationResult();
    bool succeeded = result != nullptr && example::waitForJob(session, jobId, *result);
    if (succeeded) {
        example::Session::String message(session);
        unsigned number = 0;
        result->getStatusNumber(number);
        result->getStatusMessage(*message);
        succeeded = result->isSuccess() != 0;
        std::printf("job %u %s: %u %s\n", jobId, succeeded ? "succeeded" : "failed", number, message.c_str());
    }
    session->destroyTransformationResult(&result);
    return succeeded;
}

bool downloadLog(example::Session& session, unsigned jobId, const char* logFile)
{
    example::Session::String target(session, logFile);
    unsigned success = 0;
    if (!session.succeeded(session->getTransformationManager()->getLogFile(jobId, *target, success)))
        return false;
    if (!success) {
        std::fprintf(stderr, "error: the server has no log for job %u\n", jobId);
        return false;
    }
    std::printf("log of job %u written to %s\n", jobId, logFile);
    return true;
}

}  // namespace

int main(int argc, char** argv)
{
    if (argc < 8) {
        std::fprintf(stderr, "usage: %s HOST PORT USER PASSWORD REPOSITORY WORKSPACE_FILE LOG_FILE [NAME=VALUE]...\n",
                     argv[0]);
        return 2;
    }
    example::Session session;
    if (!session.signIn(argv[1], argv[2], argv[3], argv[4]))
        return 1;

    const std::string itemName = fileNameOf(argv[6]);
    IZELServerRepository* repository = session->createRepository();
    unsigned jobId = 0;
    const bool ready = repository != nullptr && openRepository(session, argv[5], *repository) &&
                       publish(session, *repository, itemName, argv[6]) &&
                       submit(session, argv[5], itemName, argv + 8, argc - 8, jobId);
    session->destroyRepository(&repository);
    if (!ready)
        return 1;
    // The log tells why a job failed, so it is fetched either way.
    const bool succeeded = awaitSuccess(session, jobId);
    const bool logged = downloadLog(session, jobId, argv[7]);
    return succeeded && logged ? 0 : 1;
}
