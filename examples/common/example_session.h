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

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

namespace example {

class Session {
public:
    Session() { ZEL_createServerSession(&session_); }
    ~Session()
    {
        if (session_ != nullptr)
            session_->destroyConnectionInfo(&info_);
        ZEL_destroyServerSession(&session_);
    }
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    IZELServerSession& operator*() { return *session_; }
    IZELServerSession* operator->() { return session_; }

    // Connects to HOST:PORT and signs in; prints the reason and returns false when that fails.
    bool signIn(const char* host, const char* port, const char* user, const char* password)
    {
        if (session_ == nullptr) {
            std::fprintf(stderr, "error: out of memory\n");
            return false;
        }
        const long number = std::strtol(port, nullptr, 10);
        if (number <= 0 || number > 65535) {
            std::fprintf(stderr, "error: bad port '%s'\n", port);
            return false;
        }
        String hostText(*this, host), userText(*this, user), passwordText(*this, password);
        info_ =
            session_->createConnectionInfo(*hostText, static_cast<unsigned short>(number), *userText, *passwordText);
        return succeeded(session_->init(*info_, nullptr));
    }

    // Reports a failed call as "error NUMBER: TEXT" and releases its status; true for success.
    bool succeeded(IZELServerStatus* status)
    {
        if (status == nullptr)
            return true;
        std::fprintf(stderr, "error %u: %s\n", status->getMessageNumber(), status->getMessage());
        session_->destroyStatus(&status);
        return false;
    }

    // A library string that goes back to the library when it leaves scope.
    class String {
    public:
        explicit String(Session& owner, const std::string& value = "") : owner_(owner.session_)
        {
            text_ = owner_->createString();
            text_->set(value.data(), static_cast<unsigned>(value.size()));
        }
        ~String() { owner_->destroyString(&text_); }
        String(const String&) = delete;
        String& operator=(const String&) = delete;
        IZELServerString& operator*() { return *text_; }
        const char* c_str() const { return text_->c_str(); }

    private:
        IZELServerSession* owner_;
        IZELServerString* text_ = nullptr;
    };

private:
    IZELServerSession* session_ = nullptr;
    IZELServerConnectionInfo* info_ = nullptr;
};

enum class Submission { Submitted, Refused, BadParameter };

// Submits the workspace of the repository to the job service "zeljob" with the NAME=VALUE
// parameters; prints "submitted job N" and sets `jobId` when the server takes it.
inline Submission submitJob(Session& session, const char* repository, const char* workspace, char** parameters,
                            int count, unsigned& jobId)
{
    Session::String keyword(session, "zeljob"), repositoryText(session, repository), workspaceText(session, workspace);
    IZELServerTransformationRequest* request =
        session->createTransformationRequest(*keyword, *repositoryText, *workspaceText);
    if (request == nullptr)
        return Submission::Refused;
    Submission outcome = Submission::Submitted;
    for (int i = 0; i < count && outcome == Submission::Submitted; ++i) {
        const char* equals = std::strchr(parameters[i], '=');
        if (equals == nullptr || equals == parameters[i]) {
            std::fprintf(stderr, "error: parameter '%s' is not NAME=VALUE\n", parameters[i]);
            outcome = Submission::BadParameter;
            break;
        }
        Session::String name(session, std::string(parameters[i], static_cast<std::size_t>(equals - parameters[i]))),
            value(session, equals + 1);
        request->setPublishedParameter(*name, *value);
    }
    if (outcome == Submission::Submitted &&
        !session.succeeded(session->getTransformationManager()->submitJob(*request, jobId)))
        outcome = Submission::Refused;
    session->destroyTransformationRequest(&request);
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

// Waits for the job to end and prints how it ended ("job N succeeded: NUMBER TEXT"); true when it
// succeeded.
inline bool awaitSuccess(Session& session, unsigned jobId)
{
    IZELServerTransformationResult* result = session->createTransformationResult();
    bool succeeded = result != nullptr && waitForJob(session, jobId, *result);
    if (succeeded) {
        Session::String message(session);
        unsigned number = 0;
        result->getStatusNumber(number);
        result->getStatusMessage(*message);
        succeeded = result->isSuccess() != 0;
        std::printf("job %u %s: %u %s\n", jobId, succeeded ? "succeeded" : "failed", number, message.c_str());
    }
    session->destroyTransformationResult(&result);
    return succeeded;
}

}  // namespace example
