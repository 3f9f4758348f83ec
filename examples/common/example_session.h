#pragma once
// What the example programs share: a signed-in session that releases everything it handed out, the
// one way they report a failed call, and waiting for a job to end. Only the library's public
// interface is used.

#include <chrono>
#include <cstdio>
#include <cstdlib>
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
        info_ = session_->createConnectionInfo(*hostText, static_cast<unsigned short>(number), *userText,
                                               *passwordText);
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

}  // namespace example
