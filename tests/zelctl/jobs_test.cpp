// job commands: the workspace runs on the local server and leaves a log.

#include "zelctl/zelctl_fixture.h"

namespace zeltest {
namespace {

class Jobs : public Zelctl {
protected:
    void SetUp() override
    {
        Zelctl::SetUp();
        ASSERT_EQ(ann({"repo", "create", "demo"}).status, 0);
        ASSERT_EQ(ann({"item", "put", "demo", local("greet.zlw")}).status, 0);
    }
};

TEST_F(Jobs, RunSubmitWaitResultAndLog)
{
    const Outcome run = ann({"--json", "job", "run", "zeljob", "demo", "greet.zlw", "-p", "WHO=World"});
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.json()["success"], true);
    EXPECT_EQ(run.json()["status"], "SUCCESS");
    EXPECT_EQ(run.err, "job " + std::to_string(run.json()["job"].get<unsigned>()) + " submitted\n")
        << "the ID comes first, on standard error";

    const Outcome submitted = ann({"job", "submit", "zeljob", "demo", "greet.zlw", "-p", "WHO=World", "-d",
                                   "PRIORITY=50", "--notify", "done=ok"});
    ASSERT_EQ(submitted.status, 0) << submitted.err;
    const std::string id = submitted.out.substr(0, submitted.out.find('\n'));
    ASSERT_FALSE(id.empty());
    const nlohmann::json waited = annJson({"job", "wait", id});
    EXPECT_EQ(waited["status"], "SUCCESS");
    EXPECT_EQ(std::to_string(waited["job"].get<unsigned>()), id);
    EXPECT_EQ(annJson({"job", "result", id})["status"], "SUCCESS");
    const Outcome log = ann({"job", "log", id});
    EXPECT_EQ(log.status, 0) << log.err;
    EXPECT_NE(log.out.find("Hello World"), std::string::npos) << log.out;
    EXPECT_EQ(ann({"--quiet", "job", "log", id, "-o", local("job.log")}).status, 0);
    EXPECT_NE(readFile(local("job.log")).find("Hello World"), std::string::npos);
}

TEST_F(Jobs, ScheduleAbortAndRefusals)
{
    const nlohmann::json scheduled = annJson({"job", "schedule", "3600", "zeljob", "demo", "greet.zlw"});
    const std::string id = std::to_string(scheduled["job"].get<unsigned>());
    EXPECT_EQ(annJson({"job", "result", id})["status"], "DELAYED");
    EXPECT_EQ(annJson({"job", "abort", id})["done"], "aborted");

    const Outcome pair = ann({"job", "submit", "zeljob", "demo", "greet.zlw", "-p", "NOEQUALS"});
    EXPECT_EQ(pair.status, 1);
    EXPECT_EQ(pair.err, "error: expected NAME=VALUE, got 'NOEQUALS'\n");
    for (const char* command : {"result", "wait", "log"}) {
        const Outcome unknown = ann({"job", command, "999"});
        EXPECT_EQ(unknown.status, 1) << command;
        EXPECT_EQ(unknown.out, "") << command;
        EXPECT_EQ(unknown.err.rfind("error", 0), 0u) << command;
    }
}

}  // namespace
}  // namespace zeltest
