// The transformation manager on the wire: every command byte for byte against the fake server, the
// input checks that run before anything is sent, and what each operation leaves in its out values.

#include "jobs/ZELServerTransformationManager.h"

#include <filesystem>
#include <fstream>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "jobs/ZELServerLogFileInfo.h"
#include "jobs/ZELServerTransformationRequest.h"
#include "jobs/ZELServerTransformationResult.h"
#include "support/environment.h"
#include "support/signed_in_channel.h"

using namespace std::string_literals;
using namespace zeltest;

namespace zel {
namespace {

namespace fs = std::filesystem;

constexpr unsigned kUntouched = 0xDEADBEEFu;

ZELServerString str(const std::string& text) { return ZELServerString(text); }
ZELServerStringArray list(std::vector<std::string> items) { return ZELServerStringArray(std::move(items)); }

std::string emptyRequestText(const std::string& path)
{
    return path + " -XML_PARAMETER " + R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)" +
           "<TRANSFORMATION_REQUEST/>";
}

std::string invalid(const std::string& name, const std::string& value)
{
    return "The argument \"" + name + "\" has an invalid value: \"" + value + "\".";
}

// A caller's own request object, whose pair lists can have any length.
class FixedRequest final : public IZELServerTransformationRequest {
public:
    FixedRequest(std::string keyword, std::string text, std::vector<std::string> directives,
                 std::vector<std::string> notifications)
        : keyword_(std::move(keyword)),
          text_(std::move(text)),
          directives_(std::move(directives)),
          notifications_(std::move(notifications))
    {}
    void getKeyword(IZELServerString& out) const override { copy(keyword_, out); }
    void getRequestText(IZELServerString& out) const override { copy(text_, out); }
    void getDirectives(IZELServerStringArray& pairs) const override { appendAll(directives_, pairs); }
    void getNotifications(IZELServerStringArray& pairs) const override { appendAll(notifications_, pairs); }
    void setKeyword(const IZELServerString&) override {}
    void setPublishedParameter(const IZELServerString&, const IZELServerString&) override {}
    void setPublishedParameters(const IZELServerStringArray&) override {}
    unsigned getPublishedParameter(const IZELServerString&, IZELServerString&) const override { return 0; }
    void getPublishedParameters(IZELServerStringArray&) const override {}
    void setDirective(const IZELServerString&, const IZELServerString&) override {}
    void setDirectives(const IZELServerStringArray&) override {}
    unsigned getDirective(const IZELServerString&, IZELServerString&) const override { return 0; }
    void setEmbeddedDirective(const IZELServerString&, const IZELServerString&) override {}
    void setEmbeddedDirectives(const IZELServerStringArray&) override {}
    unsigned getEmbeddedDirective(const IZELServerString&, IZELServerString&) const override { return 0; }
    void getEmbeddedDirectives(IZELServerStringArray&) const override {}
    void setNotification(const IZELServerString&, const IZELServerString&) override {}
    void setNotifications(const IZELServerStringArray&) override {}
    unsigned getNotification(const IZELServerString&, IZELServerString&) const override { return 0; }

private:
    static void copy(const std::string& text, IZELServerString& out)
    {
        out.set(text.data(), static_cast<unsigned>(text.size()));
    }
    static void appendAll(const std::vector<std::string>& items, IZELServerStringArray& out)
    {
        for (const std::string& item : items) {
            out.append(item.c_str());
        }
    }
    std::string keyword_;
    std::string text_;
    std::vector<std::string> directives_;
    std::vector<std::string> notifications_;
};

class TransformationManagerWire : public SignedInChannelTest {
protected:
    // Accepts a "JOB_REQUEST" of the result-port exchange: `before` and `after` surround the port and the
    // address, which this side chooses. Everything else must match byte for byte.
    static FakeServer::Predicate transactFrame(Values before, Values after)
    {
        return [before, after](const Bytes& payload) {
            const std::optional<ParsedRequest> parsed = parseRequest(payload);
            if (!parsed || parsed->values.size() < 2 + before.size() + 2) {
                return false;
            }
            const std::string port = parsed->values[2 + before.size()].second;
            const std::string host = parsed->values[3 + before.size()].second;
            if (port.empty() || port == "0" || port.find_first_not_of("0123456789") != std::string::npos ||
                host.empty()) {
                return false;
            }
            Values expected = before;
            expected.emplace_back("requesterResultPort", port);
            expected.emplace_back("requesterHost", host);
            expected.insert(expected.end(), after.begin(), after.end());
            return payload == command("JOB_REQUEST", expected);
        };
    }

    ZELServerTransformationManager manager{channel.get()};
};

// ---- Submission and scheduling

TEST_F(TransformationManagerWire, SubmitJobStringSendsKeywordAsGivenAndRequestTrimmed)
{
    server.exchange(command("JOB_REQUEST", {{"keyword", " svc "}, {"request", "a b"}, {"d", "1"}, {"e", "2"}}),
                    reply("SUCCESS", " 42"));
    signIn();
    unsigned jobId = kUntouched;
    StatusPtr status(manager.submitJobString(str(" svc "), str("  a b  "), list({"d", "1", "e", "2", "odd"}), jobId));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(jobId, 42u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, SubmitJobSendsDirectivesThenOneNotificationPerWholePair)
{
    ZELServerTransformationRequest job(str("svc"), str("R/w/w.zlw"));
    job.setDirective(str("priority"), str("5"));
    job.setNotification(str("B"), str("y"));
    job.setNotification(str("A"), str("x"));
    server.exchange(command("JOB_REQUEST", {{"keyword", "svc"},
                                            {"request", emptyRequestText("R/w/w.zlw")},
                                            {"priority", "5"},
                                            {"notificationMsg", "A:x"},
                                            {"notificationMsg", "B:y"}}),
                    reply("SUCCESS", "17"));
    // A caller's list with an odd last entry gives one message for the whole pair only.
    server.exchange(
        command("JOB_REQUEST", {{"keyword", "svc"}, {"request", "job"}, {"d", "1"}, {"notificationMsg", "A:x"}}),
        reply("SUCCESS", "3"));
    signIn();
    unsigned jobId = 0;
    StatusPtr status(manager.submitJob(job, jobId));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(jobId, 17u);
    status.reset(manager.submitJob(FixedRequest("svc", "job", {"d", "1"}, {"A", "x", "B"}), jobId));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(jobId, 3u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, SubmissionReplyIsReadWithoutCheckingAndARefusalKeepsTheJobId)
{
    const struct {
        const char* status;
        const char* body;
        unsigned jobId;
    } cases[] = {
        {"SUCCESS", "0x2A", 42},        {"SUCCESS", "12abc", 12},         {"SUCCESS", "4294967296", 99},
        {"SUCCESS", "-1", 4294967295u}, {"ERROR", "no such service", 99},
    };
    for (const auto& c : cases) {
        server.exchange(command("JOB_REQUEST", {{"keyword", "k"}, {"request", "r"}}), reply(c.status, c.body));
    }
    signIn();
    for (const auto& c : cases) {
        unsigned jobId = 99;
        StatusPtr status(manager.submitJobString(str("k"), str("r"), ZELServerStringArray(), jobId));
        EXPECT_EQ(jobId, c.jobId) << c.body;
        if (std::string(c.status) == "SUCCESS") {
            EXPECT_EQ(status, nullptr) << describe(status.get());
        } else {
            ASSERT_NE(status, nullptr);
            EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
            EXPECT_STREQ(status->getMessage(), c.body);
        }
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, ScheduleOverridesTheCallersSecondsFromNowAndSendsNoNotifications)
{
    server.exchange(
        command("JOB_REQUEST", {{"keyword", " k"}, {"request", "r"}, {"a", "1"}, {"secondsFromNow", "60"}, {"z", "2"}}),
        reply("SUCCESS", "8"));
    server.exchange(
        command("JOB_REQUEST", {{"keyword", "svc"}, {"request", "job"}, {"d", "1"}, {"secondsFromNow", "4294967295"}}),
        reply("SUCCESS", "9"));
    signIn();
    unsigned jobId = 0;
    StatusPtr status(
        manager.scheduleJobString(str(" k"), str("r"), 60, list({"z", "2", "secondsFromNow", "5", "a", "1"}), jobId));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(jobId, 8u);
    status.reset(manager.scheduleJob(FixedRequest("svc", "job", {"d", "1"}, {"A", "x"}), 4294967295u, jobId));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(jobId, 9u);
    EXPECT_TRUE(server.verify());
}

// ---- Transaction

TEST_F(TransformationManagerWire, TransactJobStringTrimsKeywordAndTakesResultFromTheResultPort)
{
    const Bytes result = "jobStatus=SUCCESS\0id=17\0result=0:done"s;
    server
        .expectFrameWhere("transact JOB_REQUEST", transactFrame({{"keyword", "svc"}, {"request", "a b"}}, {{"d", "1"}}))
        .sendFrame(reply("SUCCESS", "accepted"))
        .connectBackAndSend(result);
    signIn();
    ZELServerString text;
    StatusPtr status(manager.transactJobString(str(" svc "), str("  a b  "), list({"d", "1"}), text));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(text.str(), result);
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.connectionsAccepted(), 1);
}

TEST_F(TransformationManagerWire, TransactJobParsesTheResultAndSendsNotifications)
{
    ZELServerTransformationRequest job(str("svc"), str("R"), str("w.zlw"));
    job.setDirective(str("priority"), str("2"));
    job.setNotification(str("A"), str("x"));
    server
        .expectFrameWhere("transact JOB_REQUEST",
                          transactFrame({{"keyword", "svc"}, {"request", emptyRequestText("R/w/w.zlw")}},
                                        {{"priority", "2"}, {"notificationMsg", "A:x"}}))
        .sendFrame(reply("SUCCESS", "accepted"))
        .connectBackAndSend("jobStatus=SUCCESS\0id=17"s);
    signIn();
    ZELServerTransformationResult result;
    StatusPtr status(manager.transactJob(job, result));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    unsigned id = 0;
    EXPECT_EQ(result.getID(id), 1u);
    EXPECT_EQ(id, 17u);
    EXPECT_EQ(result.isSuccess(), 1u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, RefusedTransactionLeavesResultAloneAndHandsOutTheErrorBody)
{
    server.expectFrameWhere("transact JOB_REQUEST", transactFrame({{"keyword", "svc"}, {"request", "r"}}, {}))
        .sendFrame(reply("ERROR", "Authorization Error: no rights"));
    server.expectFrameWhere("transact JOB_REQUEST", transactFrame({{"keyword", "svc"}, {"request", "r"}}, {}))
        .sendFrame(reply("ERROR", "busy"));
    signIn();

    ZELServerTransformationResult result;
    result.parse(str("id=5"));
    StatusPtr refused(manager.transactJob(FixedRequest("svc", "r", {}, {}), result));
    ASSERT_NE(refused, nullptr);
    EXPECT_EQ(refused->getMessageNumber(), msg::kServerError);
    EXPECT_EQ(refused->getCode(), 2u);
    ZELServerString text;
    result.getText(text);
    EXPECT_EQ(text.str(), "id=5");

    ZELServerString resultText("before");
    StatusPtr busy(manager.transactJobString(str("svc"), str("r"), ZELServerStringArray(), resultText));
    ASSERT_NE(busy, nullptr);
    EXPECT_EQ(resultText.str(), "busy");
    EXPECT_TRUE(server.verify());
}

// ---- Abort and results

TEST_F(TransformationManagerWire, AbortSendsTheIdAsSigned32BitNumberAndReturnsARefusal)
{
    const struct {
        unsigned jobId;
        const char* text;
        const char* status;
        const char* body;
    } cases[] = {
        {0, "0", "SUCCESS", "true"},
        {2147483648u, "-2147483648", "SUCCESS", "true"},
        {4294967295u, "-1", "SUCCESS", "true"},
        {5, "5", "ERROR", "job 5 is finished"},
    };
    for (const auto& c : cases) {
        server.exchange(command("ABORT_JOB_REQUEST", {{"jobID", c.text}}), reply(c.status, c.body));
    }
    signIn();
    for (const auto& c : cases) {
        StatusPtr status(manager.abortJob(c.jobId));
        EXPECT_EQ(std::string(status ? status->getMessage() : ""), std::string(c.status) == "ERROR" ? c.body : "")
            << c.text;
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, JobResultStringHandsOutTheWholeBodyAndNullIsNotFound)
{
    const Bytes body = "id=12\0jobStatus=ABORTED\0description=null"s;
    const struct {
        unsigned jobId;
        const char* text;
        const char* status;
        Bytes body;
        bool failed;
        unsigned found;
        Bytes out;
    } cases[] = {
        {4294967295u, "-1", "SUCCESS", "null", false, 0, "before"},
        {12, "12", "SUCCESS", body, false, 1, body},
        {13, "13", "SUCCESS", "nul", false, 1, "nul"},
        {1, "1", "ERROR", "unknown job", true, kUntouched, "before"},  // found is left alone
    };
    for (const auto& c : cases) {
        server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", c.text}}), reply(c.status, c.body));
    }
    signIn();
    for (const auto& c : cases) {
        unsigned found = kUntouched;
        ZELServerString text("before");
        StatusPtr status(manager.getJobResultString(c.jobId, found, text));
        EXPECT_EQ(status != nullptr, c.failed) << c.text << ": " << describe(status.get());
        EXPECT_EQ(found, c.found) << c.text;
        EXPECT_EQ(text.str(), c.out) << c.text;
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, JobResultParsesRealTextAndEmptiesTextOnNull)
{
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "12"}}),
                    reply("SUCCESS", "id=12\0jobStatus=QUEUED\0result=3:Waiting"s));
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "13"}}), reply("SUCCESS", "null"));
    signIn();
    ZELServerTransformationResult result;
    unsigned found = 0;
    StatusPtr status(manager.getJobResult(12, found, result));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(found, 1u);
    unsigned code = 0;
    unsigned number = 0;
    EXPECT_EQ(result.getJobStatus(code), 1u);
    EXPECT_EQ(code, 1u);
    EXPECT_EQ(result.getStatusNumber(number), 1u);
    EXPECT_EQ(number, 3u);

    // No result: the object is parsed from an empty text, which keeps its properties.
    status.reset(manager.getJobResult(13, found, result));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(found, 0u);
    ZELServerString text("before");
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    unsigned id = 0;
    EXPECT_EQ(result.getID(id), 1u);
    EXPECT_EQ(id, 12u);
    EXPECT_TRUE(server.verify());
}

// ---- Log files

TEST_F(TransformationManagerWire, LogFileExistsReadsTheBodyAsBoolean)
{
    const struct {
        const char* body;
        unsigned exists;
    } cases[] = {{"true", 1}, {"false", 0}, {"True", 0}, {"true ", 0}, {"1", 0}};
    for (const auto& c : cases) {
        server.exchange(command("LOG_FILEEXISTS", {{"jobID", "-2"}}), reply("SUCCESS", c.body));
    }
    signIn();
    for (const auto& c : cases) {
        unsigned exists = kUntouched;
        StatusPtr status(manager.logFileExists(4294967294u, exists));
        EXPECT_EQ(status, nullptr) << describe(status.get());
        EXPECT_EQ(exists, c.exists) << c.body;
    }
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, LogFileInfoReadsTheDescriptionAndOnlyAFailedExchangeFails)
{
    const struct {
        const char* status;
        const char* body;
        bool failed;
        unsigned found;
        unsigned size;
    } cases[] = {
        {"SUCCESS", R"(<LOG_GET_FILEINFO><LOGFILEINFO size="120"/></LOG_GET_FILEINFO>)", false, 1, 120},
        {"SUCCESS", "<LOG_GET_FILEINFO/>", false, 1, 4294967295u},  // no description: still found
        {"SUCCESS", "no log here", false, 0, 4294967295u},
        {"ERROR", "log store offline", true, 0, 4294967295u},  // found was cleared before sending
    };
    for (const auto& c : cases) {
        server.exchange(command("LOG_GET_FILEINFO", {{"jobID", "4"}}), reply(c.status, c.body));
    }
    signIn();
    for (const auto& c : cases) {
        ZELServerLogFileInfo info;
        unsigned found = kUntouched;
        StatusPtr status(manager.getLogFileInfo(4, info, found));
        EXPECT_EQ(std::string(status ? status->getMessage() : ""), c.failed ? c.body : "") << c.body;
        EXPECT_EQ(found, c.found) << c.body;
        EXPECT_EQ(info.getSize(), c.size) << c.body;
    }
    EXPECT_TRUE(server.verify());
}

class LogDownload : public TransformationManagerWire {
protected:
    static Bytes logCommand(const char* jobId)
    {
        return command("LOG_GET_FILE", {{"jobID", jobId}, {"logFileCRCCheckingEnabled", "false"}});
    }

    const TempDir scratch{"zel-jobs"};
    const std::string path = (scratch.path() / "job.log").string();
};

TEST_F(LogDownload, ReceivesTheLogAndAFinalFalseLeavesTheFileAsItWas)
{
    const Bytes content = "line one\nline two\0binary\n"s;
    for (const char* answer : {"true", "false"}) {
        server.expectFrame(logCommand(answer[0] == 't' ? "-1" : "3"))
            .sendFrame(fileHeader(content.size(), crc32(content)))
            .expectFrame(readyAck())
            .sendRaw(content)
            .expectFrame(readyAck())
            .sendFrame(reply("SUCCESS", answer));
    }
    signIn();
    unsigned success = kUntouched;
    StatusPtr status(manager.getLogFile(4294967295u, str(path), success));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(success, 1u);
    EXPECT_EQ(slurp(path), content);

    success = kUntouched;
    status.reset(manager.getLogFile(3, str(path), success));
    EXPECT_EQ(status, nullptr) << describe(status.get());
    EXPECT_EQ(success, 0u);
    EXPECT_EQ(slurp(path), content);
    EXPECT_TRUE(server.verify());
}

TEST_F(LogDownload, UnwritablePathFailsBeforeAnythingIsSent)
{
    signIn();
    const std::string missing = (scratch.path() / "no-such-folder" / "job.log").string();
    for (const std::string& target : {missing, scratch.string()}) {
        unsigned success = kUntouched;
        StatusPtr status(manager.getLogFile(3, str(target), success));
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), msg::kLocalFileWrite);
        EXPECT_EQ(status->getMessage(), "The local file \"" + target + "\" cannot be written.");
        EXPECT_EQ(success, 0u);
    }
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);  // the sign-in only
}

TEST_F(LogDownload, BrokenTransferLeavesNoFileBehind)
{
    server.expectFrame(logCommand("3"))
        .sendFrame(fileHeader(10, 0))
        .expectFrame(readyAck())
        .sendRaw("abcd")
        .closeConnection();
    signIn();
    unsigned success = kUntouched;
    StatusPtr status(manager.getLogFile(3, str(path), success));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kReceiveFailed);
    EXPECT_EQ(success, 0u);
    EXPECT_FALSE(fs::exists(path));
    EXPECT_TRUE(server.verify());
}

// ---- Input checks

// The channel is never opened: a check that let a command through would fail with a send error.
class TransformationManagerChecks : public ::testing::Test {
protected:
    ZELServerTCPIPChannel channel;
    ZELServerTransformationManager manager{&channel};
};

TEST_F(TransformationManagerChecks, KeywordAndRequestAreRefusedBeforeAnythingIsSent)
{
    const struct {
        const char* what;
        std::string keyword;
        std::string requestText;
        std::string submitMessage;  // also schedule
        std::string transactMessage;
    } cases[] = {
        {"keyword of spaces", "   ", "r", invalid("subsectionName", "   "), invalid("keyword", "   ")},
        {"keyword holding NUL", "a\0b"s, "r", invalid("subsectionName", "a"), invalid("keyword", "a")},
        {"request of spaces", " k ", "  ", invalid("request", "  "), invalid("request", "  ")},
        {"request holding NUL", "k", "x\0y"s, invalid("request", "x"), invalid("request", "x")},
        {"keyword checked first", " ", " ", invalid("subsectionName", " "), invalid("keyword", " ")},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        unsigned jobId = kUntouched;
        ZELServerString resultText("before");
        const ZELServerStringArray none;
        const StatusPtr statuses[] = {
            StatusPtr(manager.submitJobString(str(c.keyword), str(c.requestText), none, jobId)),
            StatusPtr(manager.scheduleJobString(str(c.keyword), str(c.requestText), 5, none, jobId)),
            StatusPtr(manager.submitJob(FixedRequest(c.keyword, c.requestText, {}, {}), jobId)),
            StatusPtr(manager.transactJobString(str(c.keyword), str(c.requestText), none, resultText)),
        };
        const std::string expected[] = {c.submitMessage, c.submitMessage, c.submitMessage, c.transactMessage};
        for (std::size_t i = 0; i < std::size(statuses); ++i) {
            ASSERT_NE(statuses[i], nullptr) << i;
            EXPECT_EQ(statuses[i]->getMessageNumber(), msg::kInvalidArgument) << i;
            EXPECT_EQ(statuses[i]->getMessage(), expected[i]) << i;
        }
        EXPECT_EQ(jobId, kUntouched);
        EXPECT_EQ(resultText.str(), "before");
    }
}

TEST_F(TransformationManagerChecks, OnlySpacesAreTrimmed)
{
    // A tab is part of the keyword: the check passes and the command reaches the (closed) channel.
    unsigned jobId = kUntouched;
    StatusPtr status(manager.submitJobString(str("\t"), str("r\n"), ZELServerStringArray(), jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kNotConnected);
    EXPECT_EQ(jobId, kUntouched);
}

TEST_F(TransformationManagerChecks, RequestTextThatCannotBeComposedIsRefused)
{
    ZELServerTransformationRequest job(str("svc"), str("p"));
    job.setPublishedParameter(str("P"), str("a\0b"s));
    unsigned jobId = kUntouched;
    StatusPtr status(manager.submitJob(job, jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessage(), invalid("request", ""));
}

}  // namespace
}  // namespace zel
