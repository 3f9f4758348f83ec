#pragma once
// End-to-end tests: the library, through its public interface only, against the local development
// server started for the test.

#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/local_server.h"

namespace zeltest {

inline const char* kE2eConfig = "[user ann]\npassword = pw-ann\nroles = admin\n"
                                "[server]\nworkers = 4\n"
                                "[user bob]\npassword = pw-bob\nroles = user\n"
                                "[user vic]\npassword = pw-vic\nroles = viewer\n"
                                "[role outsider]\nrights = tokens\n"
                                "[user zed]\npassword = pw-zed\nroles = outsider\n"
                                "[sharedresource DATA]\npath = shared\n";

inline std::string readAll(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

inline void writeFile(const std::string& path, const std::string& content)
{
    std::ofstream(path, std::ios::binary) << content;
}

using Session = IZELServerSession;

// The status number of a request the server answered with an error.
constexpr unsigned kRefused = 393625;

// Job status codes of IZELServerTransformationResult::getJobStatus.
enum JobStatus : unsigned {
    kQueued = 1,
    kDelayed = 2,
    kInProcess = 4,
    kAborted = 6,
    kSucceeded = 7,
    kServiceFailed = 8,
    kJobFailed = 9
};

// A session of the library; strings made for a test are released before the session goes.
class Client {
public:
    Client() { ZEL_createServerSession(&session_); }
    ~Client()
    {
        strings_.clear();
        session_->destroyConnectionInfo(&info_);
        ZEL_destroyServerSession(&session_);
    }

    IZELServerSession& session() { return *session_; }

    // An object made by the session, destroyed through `destroy` when the owner goes; owners go
    // before their Client.
    template <typename T>
    using Owned = std::unique_ptr<T, std::function<void(T*)>>;
    template <typename T>
    Owned<T> own(T* object, void (IZELServerSession::*destroy)(T**))
    {
        return Owned<T>(object, [session = session_, destroy](T* p) { (session->*destroy)(&p); });
    }

    IZELServerString& text(const std::string& value = "")
    {
        strings_.emplace_back(session_->createString(), Releaser{session_});
        strings_.back()->set(value.data(), static_cast<unsigned>(value.size()));
        return *strings_.back();
    }

    // Signs in with a password; the status number, 0 on success.
    unsigned signIn(std::uint16_t port, const std::string& user, const std::string& password)
    {
        session_->destroyConnectionInfo(&info_);
        info_ = session_->createConnectionInfo(text("127.0.0.1"), port, text(user), text(password));
        return take(session_->init(*info_, nullptr));
    }

    // Signs in with connection properties (flat pairs).
    unsigned signInWith(std::uint16_t port, const std::vector<std::string>& properties)
    {
        IZELServerStringArray* list = session_->createStringArray();
        for (const std::string& entry : properties)
            list->append(entry.c_str());
        session_->destroyConnectionInfo(&info_);
        info_ = session_->createConnectionInfo(text("127.0.0.1"), port, *list);
        session_->destroyStringArray(&list);
        return take(session_->init(*info_, nullptr));
    }

    // The number of a status, which is released; 0 for success. The text of the last one is kept.
    unsigned take(IZELServerStatus* status)
    {
        lastMessage_ = status ? status->getMessage() : "";
        lastCode_ = status ? status->getCode() : 0;
        const unsigned number = status ? status->getMessageNumber() : 0;
        session_->destroyStatus(&status);
        return number;
    }
    const std::string& lastMessage() const { return lastMessage_; }
    // The kind of the last status: 1 authentication, 2 authorization, 0 anything else.
    unsigned lastCode() const { return lastCode_; }

    // Runs an operation that answers through a flag: the flag when it succeeded, else -1. The flag
    // starts out as 7 (or true), so an answer the operation forgot to set shows.
    template <typename Flag = unsigned, typename Operation>
    long flag(Operation operation)
    {
        Flag value = static_cast<Flag>(7);
        return take(operation(value)) == 0 ? static_cast<long>(value) : -1;
    }

    // Adds a repository (when missing) and fetches it; owned by the caller (destroyRepository).
    IZELServerRepository* repository(const std::string& name)
    {
        IZELServerRepositoryManager* manager = session_->getRepositoryManager();
        unsigned exists = 0;
        take(manager->repositoryExists(text(name), exists));
        if (!exists)
            take(manager->addRepository(text(name), text("")));
        IZELServerRepository* repository = session_->createRepository();
        unsigned found = 0;
        take(manager->getRepository(text(name), *repository, found));
        return repository;
    }

    // Polls a job's result until it has ended or `seconds` passed; the last job status code.
    unsigned waitForJob(unsigned id, IZELServerTransformationResult& result, int seconds = 30)
    {
        IZELServerTransformationManager* jobs = session_->getTransformationManager();
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
        unsigned status = kQueued;
        while (std::chrono::steady_clock::now() < deadline) {
            unsigned found = 0;
            if (take(jobs->getJobResult(id, found, result)) != 0)
                return 0;
            status = 0;
            result.getJobStatus(status);
            if (found && status != kQueued && status != kInProcess && status != kDelayed)
                return status;
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
        }
        return status;
    }

    // The shared resource of that name, or null; owned by the caller (destroyMountPoint).
    IZELServerMountPoint* area(const std::string& name)
    {
        IZELServerMountPoint* area = session_->createMountPoint();
        unsigned found = 0;
        if (take(session_->getMountPointManager()->getSharedResource(text(name), *area, found)) != 0 || !found)
            session_->destroyMountPoint(&area);
        return area;
    }

private:
    struct Releaser {
        IZELServerSession* owner;
        void operator()(IZELServerString* s) const { owner->destroyString(&s); }
    };

    IZELServerSession* session_ = nullptr;
    IZELServerConnectionInfo* info_ = nullptr;
    std::vector<std::unique_ptr<IZELServerString, Releaser>> strings_;
    std::string lastMessage_;
    unsigned lastCode_ = 0;
};

class EndToEnd : public ::testing::Test {
protected:
    void SetUp() override
    {
        server = std::make_unique<LocalServer>(ZEL_TEST_ZELSERVERD, kE2eConfig);
        ASSERT_EQ(server->failure(), "");
    }

    std::string local(const std::string& name) const { return server->directory() + "/" + name; }

    // Writes `content` to a local file and adds it to `repository` as the item `name`.
    unsigned addItem(Client& client, IZELServerRepository& repository, const std::string& name,
                     const std::string& content)
    {
        writeFile(local(name), content);
        return client.take(repository.addItem(client.text(name), client.text(local(name))));
    }

    std::unique_ptr<LocalServer> server;
};

}  // namespace zeltest
