// The whole round trip of a workspace: uploads a local workspace file into a repository (made when
// missing, the item replaced when present), runs it as a job, waits for the job to end and downloads
// the job's log into a local file.
//
//   publish_and_run HOST PORT USER PASSWORD REPOSITORY WORKSPACE_FILE LOG_FILE [NAME=VALUE]...
//
// The item takes the workspace file's own name. The job service is "zeljob".

#include <cstdio>
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
    const auto nameText = session.text(name), description = session.text("Made by publish_and_run");
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
    const auto item = session.text(itemName), source = session.text(localFile);
    unsigned exists = 0;
    if (!session.succeeded(repository.itemExists(*item, exists)))
        return false;
    const bool uploaded = exists ? session.succeeded(repository.updateItem(*item, *source))
                                 : session.succeeded(repository.addItem(*item, *source));
    if (uploaded)
        std::printf("%s item %s\n", exists ? "updated" : "added", itemName.c_str());
    return uploaded;
}

bool downloadLog(example::Session& session, unsigned jobId, const char* logFile)
{
    const auto target = session.text(logFile);
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
    const auto repository = session.own(session->createRepository());
    unsigned jobId = 0;
    const bool ready = repository && openRepository(session, argv[5], *repository) &&
                       publish(session, *repository, itemName, argv[6]) &&
                       example::submitJob(session, argv[5], itemName.c_str(), argv + 8, argc - 8, jobId) ==
                           example::Submission::Submitted;
    if (!ready)
        return 1;
    // The log tells why a job failed, so it is fetched either way.
    const int ended = example::awaitJob(session, jobId);
    const bool logged = downloadLog(session, jobId, argv[7]);
    return logged ? ended : 1;
}
