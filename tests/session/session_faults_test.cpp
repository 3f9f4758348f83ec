// What a session does when it is used at the wrong time or something goes wrong underneath it: no
// crash and no exception, only statuses.

#include <atomic>
#include <new>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "api/heap.h"
#include "hostile_fixture.h"

namespace zeltest {
namespace {

TEST_F(HostileSessionTest, CommandsWithoutAConnectionReportNotConnected)
{
    EXPECT_EQ(sessionProperty().number, 393622u) << "before init";

    FakeServer server;
    server.exchange(firstHandshake(), signedIn());
    signIn(server);
    EXPECT_EQ(outcome(session->disconnect()).number, 0u);
    EXPECT_EQ(sessionProperty().number, 393622u) << "after disconnect";
    IZELServerString* name = session->createString();
    name->assign("r");
    unsigned found = 7;
    EXPECT_EQ(outcome(session->getRepositoryManager()->repositoryExists(*name, found)).number, 393622u);
    session->destroyString(&name);
    EXPECT_TRUE(server.verify());
}

TEST_F(HostileSessionTest, RefusedSignInLeavesAnUnauthenticatedIdentity)
{
    FakeServer server;
    server.exchange(firstHandshake(), reply("SUCCESS", "<S/>"));
    server.start();
    EXPECT_EQ(init(server.port()).number, 393631u);
    ASSERT_NE(session->getIdentity(), nullptr);
    EXPECT_FALSE(session->getIdentity()->isAuthenticated());
    EXPECT_TRUE(server.verify());
}

std::atomic<int> exhaustionReports{0};
void countExhaustion(int) { ++exhaustionReports; }

// A connection whose property lookup fails the way client code can.
class ThrowingConnection final : public IZELServerConnectionInfo {
public:
    explicit ThrowingConnection(bool outOfMemory) : outOfMemory_(outOfMemory) {}
    void getHost(IZELServerString& out) const override { out.assign("127.0.0.1"); }
    unsigned short getPort() const override { return 1; }
    void getUserName(IZELServerString& out) const override { out.assign("ann"); }
    void getPassword(IZELServerString& out) const override { out.assign("pw1"); }
    unsigned getConnectionKind() const override { return 0; }
    void getAddress(IZELServerString& out) const override { out.assign(""); }
    void getAuxiliaryText(IZELServerString& out) const override { out.assign(""); }
    unsigned getAuthenticationKind() const override { return 0; }
    bool getProperty(const IZELServerString&, IZELServerString&) const override
    {
        if (outOfMemory_) {
            throw std::bad_alloc();
        }
        throw std::runtime_error("property store unavailable");
    }

private:
    bool outOfMemory_;
};

TEST_F(HostileSessionTest, NoExceptionLeavesTheInterface)
{
    const zel::heap::FailureRoutine previous = zel::heap::setFailureRoutine(&countExhaustion);
    struct Case {
        bool outOfMemory;
        const char* message;
        int reports;  // calls of the out-of-memory routine
    };
    const Case cases[] = {
        {true, "Not enough memory for the operation.", 1},
        {false, "property store unavailable", 0},
    };
    for (const Case& c : cases) {
        exhaustionReports = 0;
        const ThrowingConnection info(c.outOfMemory);
        const Outcome got = outcome(session->init(info, nullptr));
        EXPECT_EQ(got.number, 393625u);
        EXPECT_EQ(got.message, c.message);
        EXPECT_EQ(exhaustionReports.load(), c.reports);
    }
    zel::heap::setFailureRoutine(previous);
}

}  // namespace
}  // namespace zeltest
