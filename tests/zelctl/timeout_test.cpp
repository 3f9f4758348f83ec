// The global --timeout against a server that accepts connections and never answers: a command gives
// up with exit status 5 instead of waiting for ever (the test's own time limit catches a hang).

#include "support/sockets.h"
#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

TEST_F(Zelctl, GlobalTimeoutEndsTheWaitForASilentServer)
{
    // The system accepts connections into the backlog; nobody ever reads from them.
    const Socket silent = listenOnLoopback(8);
    ASSERT_TRUE(silent.valid());
    const std::string port = std::to_string(localPort(silent).value_or(0));
    for (const char* command : {"ping", "whoami"}) {
        const Outcome run = raw({"--port", port, "--user", "ann", "--timeout", "1", command}, "", false);
        EXPECT_EQ(run.status, 5) << command << ": " << run.err;
        EXPECT_NE(run.err.find("timed out after 1 second waiting for 127.0.0.1:" + port), std::string::npos) << run.err;
    }
}

}  // namespace
}  // namespace zeltest
