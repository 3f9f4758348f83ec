#pragma once
// End-to-end tests: the library, through its public interface only, against the local development
// server started for the test.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/local_server.h"

namespace zeltest {

inline const char* kE2eConfig =
    "[user ann]\npassword = pw-ann\nroles = admin\n"
    "[user bob]\npassword = pw-bob\nroles = user\n"
    "[sharedresource DATA]\npath = shared\n";

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
        const unsigned number = status ? status->getMessageNumber() : 0;
        session_->destroyStatus(&status);
        return number;
    }
    const std::string& lastMessage() const { return lastMessage_; }

private:
    struct Releaser {
        IZELServerSession* owner;
        void operator()(IZELServerString* s) const { owner->destroyString(&s); }
    };

    IZELServerSession* session_ = nullptr;
    IZELServerConnectionInfo* info_ = nullptr;
    std::vector<std::unique_ptr<IZELServerString, Releaser>> strings_;
    std::string lastMessage_;
};

class EndToEnd : public ::testing::Test {
protected:
    void SetUp() override
    {
        server = std::make_unique<LocalServer>(ZEL_TEST_ZELSERVERD, kE2eConfig);
        ASSERT_EQ(server->failure(), "");
    }

    std::unique_ptr<LocalServer> server;
};

}  // namespace zeltest
