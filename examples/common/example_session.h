#pragma once
// What the example programs share: a signed-in session that releases everything it handed out, the
// one way they report a failed call, and following a job to its end. Only the library's public
// interface is used.

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>

#include <zelserverapi/ZELServerOwned.h>

namespace example {

class Session {
public:
    Session() : session_(zelServerCreateSession()) {}

    IZELServerSession& operator*() { return *session_; }
    IZELServerSession* operator->() { return session_.get(); }

    // Connects to HOST:PORT and signs in; prints the reason and returns false when that fails.
    bool signIn(const char* host, const char* port, const char* user, const char* password)
    {
        if (!session_) {
            std::fprintf(stderr, "error: out of memory\n");
            return false;
        }
        const long number = std::strtol(port, nullptr, 10);
        if (number <= 0 || number > 65535) {
            std::fprintf(stderr, "error: bad port '%s'\n", port);
            return false;
        }
        info_ = own(session_->createConnectionInfo(*text(host), static_cast<unsigned short>(number), *text(user),
                                                   *text(password)));
        return succeeded(session_->init(*info_, nullptr));
    }

    // Reports a failed call as "error NUMBER: TEXT" and releases its status; true for success.
    bool succeeded(IZELServerStatus* status)
    {
        const ZELServerOwned<IZELServerStatus> owned = own(status);
        if (owned)
            std::fprintf(stderr, "error %u: %s\n", owned->getMessageNumber(), owned->getMessage());
        return !owned;
    }

    // Hands what the session made back to it when the owner leaves scope.
    template <typename T>
    ZELServerOwned<T> own(T* object)
    {
        return zelServerOwn(*session_, object);
    }

    // A library string holding `value`.
    ZELServerOwned<IZELServerString> text(const std::string& value = "")
    {
        ZELServerOwned<IZELServerString> string = own(session_->createString());
        string->set(value.data(), static_cast<unsigned>(value.size()));
        return string;
    }

private:
    ZELServerOwned<IZELServerSession> session_;
    ZELServerOwned<IZELServerConnectionInfo> info_;
};

enum class Submission { Submitted, Refused, BadParameter };

// Submits the workspace of the repository to the job service "zeljob" with the NAME=VALUE
// parameters; prints "submitted job N" and sets `jobId` when the server takes it.
inline Submission submitJob(Session& session, const char* repository, const char* workspace, char** parameters,
                            int count, unsigned& jobId)
{
    const auto request = session.own(session->createTransformationRequest(
        *session.text("zeljob"), *session.text(repository), *session.text(workspace)));
    if (!request)
        return Submission::Refused;
    Submission outcome = Submission::Submitted;
    for (int i = 0; i < count && outcome == Submission::Submitted; ++i) {
        const char* equals = std::strchr(parameters[i], '=');
        if (equals == nullptr || equals == parameters[i]) {
            std::fprintf(stderr, "error: parameter '%s' is not NAME=VALUE\n", parameters[i]);
            outcome = Submission::BadParameter;
            break;
        }
        const std::string name(parameters[i], static_cast<std::size_t>(equals - parameters[i]));
        request->setPublishedParameter(*session.text(name), *session.text(equals + 1));
    }
    if (outcome == Submission::Submitted &&
        !session.succeeded(session->getTransformationManager()->submitJob(*request, jobId)))
        outcome = Submission::Refused;
    if (outcome == Submission::Submitted)
        std::printf("submitted job %u\n", jobId);
    return outcome;
}

// Asks for the job's result until it has ended; false when asking fails or it takes too long.
inline bool waitForJob(Session& session, unsigned jobId, IZELServerTransformationResult& result)
{
    // Job statuses while the job has not ended.
    constexpr unsigned kSubmitted = 0, kQueued = 1, kDelayed = 2, kInProcess = 4;
    IZELServerTransformationManager* jobs = session->getTransformationManager();
    for (int attempt = 0; attempt < 1200; ++attempt) {
        unsigned found = 0, status = kQueued;
        if (!session.succeeded(jobs->getJobResult(jobId, found, result)))
            return false;
        if (!found) {
            std::fprintf(stderr, "error: the server does not know job %u\n", jobId);
            return false;
        }
        result.getJobStatus(status);
        if (status != kSubmitted && status != kQueued && status != kDelayed && status != kInProcess)
            return true;
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
    }
    std::fprintf(stderr, "error: job %u did not end within two minutes\n", jobId);
    return false;
}

// Exit statuses for how a job ended, the same as zelctl's: 0 when it succeeded, 3 when it failed, 4
// when it was aborted (or deleted) before it ended; 1 is left for a failed call.
constexpr int kJobFailed = 3;
constexpr int kJobAborted = 4;

// Waits for the job to end, prints how it ended ("job N succeeded: NUMBER TEXT") and returns the exit
// status for it.
inline int awaitJob(Session& session, unsigned jobId)
{
    constexpr unsigned kDeleted = 5, kAborted = 6;
    const auto result = session.own(session->createTransformationResult());
    if (!result || !waitForJob(session, jobId, *result))
        return 1;
    const auto message = session.text();
    unsigned number = 0, status = 0;
    result->getStatusNumber(number);
    result->getStatusMessage(*message);
    result->getJobStatus(status);
    const bool aborted = status == kAborted || status == kDeleted;
    const bool succeeded = !aborted && result->isSuccess() != 0;
    std::printf("job %u %s: %u %s\n", jobId,
                succeeded ? "succeeded"
                : aborted ? "was aborted"
                          : "failed",
                number, message->c_str());
    return succeeded ? 0 : aborted ? kJobAborted : kJobFailed;
}

}  // namespace example
