#pragma once
// End-to-end tests: the library, through its public interface only, against the local development
// server started for the test. Each suite walks one manager's operations as a table of steps run in
// order, every operation with its success and its refusal.

#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <zelserverapi/ZELServerOwned.h>
#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/helpers.h"
#include "support/local_server.h"

namespace zeltest {

inline const char* kE2eConfig = "[user ann]\npassword = pw-ann\nroles = admin\n"
                                "[server]\nworkers = 4\n"
                                "[user bob]\npassword = pw-bob\nroles = user\n"
                                "[user vic]\npassword = pw-vic\nroles = viewer\n"
                                "[role outsider]\nrights = tokens\n"
                                "[user zed]\npassword = pw-zed\nroles = outsider\n"
                                "[sharedresource DATA]\npath = shared\n";

// The status number of a request the server answered with an error.
constexpr unsigned kRefused = 393625;

// Job status codes of IZELServerTransformationResult::getJobStatus.
enum JobStatus : unsigned { kQueued = 1, kDelayed = 2, kInProcess = 4, kAborted = 6, kSucceeded = 7, kJobFailed = 9 };

// One operation of a table: it answers through `flag` (which starts out as kUntouched, so an answer
// the operation forgot to set shows) and returns its status.
using Operation = std::function<IZELServerStatus*(unsigned& flag)>;
constexpr unsigned kUntouched = 7;
struct Step {
    const char* what;
    Operation operation;
    long expected;  // the flag after success, or minus the status number
};
// The outcome of a step the server refuses.
constexpr long kDenied = -static_cast<long>(kRefused);
// `operation`, answering the entries of `list` after it.
template <typename List>
Operation counting(List& list, std::function<IZELServerStatus*()> operation)
{
    return [&list, operation](unsigned& flag) {
        IZELServerStatus* status = operation();
        flag = list.entries();
        return status;
    };
}
// `operation`, whose answer becomes kCheckFailed when one of `checks` fails after it (also after a
// refusal).
constexpr unsigned kCheckFailed = 1000;
template <typename... Checks>
Operation checking(Operation operation, Checks... checks)
{
    return [operation, checks...](unsigned& flag) {
        IZELServerStatus* status = operation(flag);
        if (!(checks() && ...))
            flag = kCheckFailed;
        return status;
    };
}

// For operations that answer through a bool, which a refusal leaves as the caller set it (true).
inline Operation boolean(std::function<IZELServerStatus*(bool&)> operation)
{
    return [operation](unsigned& flag) {
        bool answer = true;
        IZELServerStatus* status = operation(answer);
        flag = status == nullptr ? answer : answer ? kUntouched : kCheckFailed;
        return status;
    };
}

// A session of the library; strings made for a test are released before the session goes.
class Client {
public:
    Client() : session_(zelServerCreateSession()) {}

    IZELServerSession& session() { return *session_; }

    template <typename T>
    ZELServerOwned<T> own(T* object)
    {
        return zelServerOwn(*session_, object);
    }

    IZELServerString& text(const std::string& value = "")
    {
        strings_.push_back(own(session_->createString()));
        strings_.back()->set(value.data(), static_cast<unsigned>(value.size()));
        return *strings_.back();
    }

    // Signs in with a password; the status number, 0 on success.
    unsigned signIn(std::uint16_t port, const std::string& user, const std::string& password)
    {
        info_ = own(session_->createConnectionInfo(text("127.0.0.1"), port, text(user), text(password)));
        return take(session_->init(*info_, nullptr));
    }

    // Signs in with connection properties (flat pairs).
    unsigned signInWith(std::uint16_t port, const std::vector<std::string>& properties)
    {
        auto list = own(session_->createStringArray());
        for (const std::string& entry : properties)
            list->append(entry.c_str());
        info_ = own(session_->createConnectionInfo(text("127.0.0.1"), port, *list));
        return take(session_->init(*info_, nullptr));
    }

    // The number of a status, which is released; 0 for success. The text and kind of the last one
    // are kept (kind 1 authentication, 2 authorization, 0 anything else).
    unsigned take(IZELServerStatus* status)
    {
        lastMessage_ = status ? status->getMessage() : "";
        lastCode_ = status ? status->getCode() : 0;
        const unsigned number = status ? status->getMessageNumber() : 0;
        session_->destroyStatus(&status);
        return number;
    }
    const std::string& lastMessage() const { return lastMessage_; }
    unsigned lastCode() const { return lastCode_; }

    // The flag of a successful operation, else minus its status number; a refused operation must
    // not answer true.
    long outcome(const Operation& operation)
    {
        unsigned flag = kUntouched;
        const unsigned number = take(operation(flag));
        if (number == 0)
            return flag;
        EXPECT_TRUE(flag == 0 || flag == kUntouched) << "flag after the refusal: " << flag;
        return -static_cast<long>(number);
    }
    void run(const std::vector<Step>& steps)
    {
        for (const Step& step : steps) {
            SCOPED_TRACE(step.what);
            EXPECT_EQ(outcome(step.operation), step.expected) << lastMessage_;
        }
    }

    // Adds a repository (when missing) and fetches it.
    ZELServerOwned<IZELServerRepository> repository(const std::string& name)
    {
        IZELServerRepositoryManager* manager = session_->getRepositoryManager();
        unsigned exists = 0;
        take(manager->repositoryExists(text(name), exists));
        if (!exists)
            take(manager->addRepository(text(name), text("")));
        auto repository = own(session_->createRepository());
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

    // The shared resource of that name, or null.
    ZELServerOwned<IZELServerMountPoint> area(const std::string& name)
    {
        auto area = own(session_->createMountPoint());
        unsigned found = 0;
        if (take(session_->getMountPointManager()->getSharedResource(text(name), *area, found)) != 0 || !found)
            area.reset();
        return area;
    }

private:
    ZELServerOwned<IZELServerSession> session_;  // goes last
    ZELServerOwned<IZELServerConnectionInfo> info_;
    std::vector<ZELServerOwned<IZELServerString>> strings_;
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
        spew(local(name), content);
        return client.take(repository.addItem(client.text(name), client.text(local(name))));
    }

    std::unique_ptr<LocalServer> server;
};

}  // namespace zeltest
