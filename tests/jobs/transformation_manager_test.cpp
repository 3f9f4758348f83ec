// The transformation manager on the wire: every command byte for byte against the fake server, the
// input checks that run before anything is sent, and what each operation leaves in its out values.

#include "jobs/ZELServerTransformationManager.h"

#include <filesystem>
#include <fstream>
#include <iterator>
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
#include "jobs/jobs_factories.h"
#include "session/ZELServerConnectionInfo.h"
#include "support/environment.h"
#include "support/fake_server.h"
#include "transport/ZELServerTCPIPChannel.h"

using namespace std::string_literals;
using namespace zeltest;

namespace zel {
namespace {

namespace fs = std::filesystem;
using StatusPtr = std::unique_ptr<IZELServerStatus>;

constexpr const char* kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";
constexpr const char* kSessionDocument =
    R"(<SERVER_SESSION_INIT><IDENTITY id="ann" is_authenticated="true"/></SERVER_SESSION_INIT>)";
constexpr unsigned kUntouched = 0xDEADBEEFu;

ZELServerString str(const std::string& text) { return ZELServerString(text); }
ZELServerStringArray list(std::vector<std::string> items) { return ZELServerStringArray(std::move(items)); }

// The identity document every request carries once signed in, rooted at the command's keyword.
std::string identityDocument(const std::string& keyword)
{
    return kDeclaration + ("<" + keyword + R"(><IDENTITY id="ann" is_authenticated="true"><ROLES/></IDENTITY></)" +
                           keyword + ">");
}

// The payload of a command as the signed-in channel sends it.
Bytes command(const std::string& keyword, const Values& values)
{
    Values all{{"identityObject", identityDocument(keyword)}, {"clientID", ""}};
    all.insert(all.end(), values.begin(), values.end());
    return request(keyword, all);
}

std::string emptyRequestText(const std::string& path)
{
    return path + " -XML_PARAMETER " + kDeclaration + "<TRANSFORMATION_REQUEST/>";
}

std::string messageOf(const StatusPtr& status) { return status ? status->getMessage() : "(no status)"; }

class TransformationManagerWire : public ::testing::Test {
protected:
    void SetUp() override
    {
        server.exchange(request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}}),
                        reply("SUCCESS", kSessionDocument));
    }

    // Starts the script (the steps added after the sign-in) and signs in.
    void connect()
    {
        server.start();
        ZELServerConnectionInfo info(str("127.0.0.1"), server.port(), str("ann"), str("pw1"));
        StatusPtr status(channel.open(info, nullptr));
        ASSERT_EQ(status, nullptr) << messageOf(status);
    }

    FakeServer server;
    ZELServerTCPIPChannel channel;
    ZELServerTransformationManager manager{&channel};
};

// ---- Submission -------------------------------------------------------------------------------------

TEST_F(TransformationManagerWire, SubmitJobStringSendsKeywordAsGivenAndRequestTrimmed)
{
    server.exchange(command("JOB_REQUEST", {{"keyword", " svc "}, {"request", "a b"}, {"d", "1"}, {"e", "2"}}),
                    reply("SUCCESS", " 42"));
    connect();
    unsigned jobId = kUntouched;
    StatusPtr status(manager.submitJobString(str(" svc "), str("  a b  "), list({"d", "1", "e", "2", "odd"}), jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(jobId, 42u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, SubmitJobSendsDirectivesThenOneNotificationPerPair)
{
    ZELServerTransformationRequest job(str("svc"), str("R/w/w.ext"));
    job.setDirective(str("priority"), str("5"));
    job.setNotification(str("B"), str("y"));
    job.setNotification(str("A"), str("x"));
    server.exchange(command("JOB_REQUEST", {{"keyword", "svc"},
                                            {"request", emptyRequestText("R/w/w.ext")},
                                            {"priority", "5"},
                                            {"notificationMsg", "A:x"},
                                            {"notificationMsg", "B:y"}}),
                    reply("SUCCESS", "17"));
    connect();
    unsigned jobId = 0;
    StatusPtr status(manager.submitJob(job, jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(jobId, 17u);
    EXPECT_TRUE(server.verify());
}

// A caller's own request object, whose pair lists can have any length.
class FixedRequest final : public IZELServerTransformationRequest {
public:
    FixedRequest(std::string keyword, std::string text, std::vector<std::string> directives,
                 std::vector<std::string> notifications)
        : keyword_(std::move(keyword)), text_(std::move(text)), directives_(std::move(directives)),
          notifications_(std::move(notifications))
    {
    }
    void setKeyword(const IZELServerString&) override {}
    void getKeyword(IZELServerString& out) const override { out.set(keyword_.data(), static_cast<unsigned>(keyword_.size())); }
    void setPublishedParameter(const IZELServerString&, const IZELServerString&) override {}
    void setPublishedParameters(const IZELServerStringArray&) override {}
    unsigned getPublishedParameter(const IZELServerString&, IZELServerString&) const override { return 0; }
    void getPublishedParameters(IZELServerStringArray&) const override {}
    void setDirective(const IZELServerString&, const IZELServerString&) override {}
    void setDirectives(const IZELServerStringArray&) override {}
    unsigned getDirective(const IZELServerString&, IZELServerString&) const override { return 0; }
    void getDirectives(IZELServerStringArray& pairs) const override { appendAll(directives_, pairs); }
    void setEmbeddedDirective(const IZELServerString&, const IZELServerString&) override {}
    void setEmbeddedDirectives(const IZELServerStringArray&) override {}
    unsigned getEmbeddedDirective(const IZELServerString&, IZELServerString&) const override { return 0; }
    void getEmbeddedDirectives(IZELServerStringArray&) const override {}
    void getRequestText(IZELServerString& out) const override { out.set(text_.data(), static_cast<unsigned>(text_.size())); }
    void setNotification(const IZELServerString&, const IZELServerString&) override {}
    void setNotifications(const IZELServerStringArray&) override {}
    unsigned getNotification(const IZELServerString&, IZELServerString&) const override { return 0; }
    void getNotifications(IZELServerStringArray& pairs) const override { appendAll(notifications_, pairs); }

private:
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

TEST_F(TransformationManagerWire, NotificationsWithAnOddLastEntryGiveOneMessage)
{
    const FixedRequest job("svc", "job", {"d", "1"}, {"A", "x", "B"});
    server.exchange(
        command("JOB_REQUEST", {{"keyword", "svc"}, {"request", "job"}, {"d", "1"}, {"notificationMsg", "A:x"}}),
        reply("SUCCESS", "3"));
    connect();
    unsigned jobId = 0;
    StatusPtr status(manager.submitJob(job, jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(jobId, 3u);
    EXPECT_TRUE(server.verify());
}

struct JobIdReplyCase {
    const char* body;
    unsigned jobId;
};

class SubmissionReply : public TransformationManagerWire, public ::testing::WithParamInterface<JobIdReplyCase> {};

TEST_P(SubmissionReply, JobIdIsReadWithoutChecking)
{
    server.exchange(command("JOB_REQUEST", {{"keyword", "k"}, {"request", "r"}}), reply("SUCCESS", GetParam().body));
    connect();
    unsigned jobId = 99;
    StatusPtr status(manager.submitJobString(str("k"), str("r"), ZELServerStringArray(), jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(jobId, GetParam().jobId);
    EXPECT_TRUE(server.verify());
}

const JobIdReplyCase kJobIdReplies[] = {
    {" 42", 42}, {"0x2A", 42}, {"12abc", 12}, {"no number", 99}, {"4294967296", 99}, {"-1", 4294967295u},
};

INSTANTIATE_TEST_SUITE_P(Table, SubmissionReply, ::testing::ValuesIn(kJobIdReplies),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST_F(TransformationManagerWire, SubmissionRefusedByServerKeepsJobId)
{
    server.exchange(command("JOB_REQUEST", {{"keyword", "k"}, {"request", "r"}}), reply("ERROR", "no such service"));
    connect();
    unsigned jobId = 99;
    StatusPtr status(manager.submitJobString(str("k"), str("r"), ZELServerStringArray(), jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kServerError);
    EXPECT_STREQ(status->getMessage(), "no such service");
    EXPECT_EQ(jobId, 99u);
    EXPECT_TRUE(server.verify());
}

// ---- Scheduling -------------------------------------------------------------------------------------

TEST_F(TransformationManagerWire, ScheduleOverridesTheCallersSecondsFromNow)
{
    server.exchange(command("JOB_REQUEST",
                            {{"keyword", " k"}, {"request", "r"}, {"a", "1"}, {"secondsFromNow", "60"}, {"z", "2"}}),
                    reply("SUCCESS", "8"));
    connect();
    unsigned jobId = 0;
    StatusPtr status(
        manager.scheduleJobString(str(" k"), str("r"), 60, list({"z", "2", "secondsFromNow", "5", "a", "1"}), jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(jobId, 8u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, ScheduleJobSendsTheObjectsDirectivesButNoNotifications)
{
    const FixedRequest job("svc", "job", {"d", "1"}, {"A", "x"});
    server.exchange(
        command("JOB_REQUEST", {{"keyword", "svc"}, {"request", "job"}, {"d", "1"}, {"secondsFromNow", "4294967295"}}),
        reply("SUCCESS", "9"));
    connect();
    unsigned jobId = 0;
    StatusPtr status(manager.scheduleJob(job, 4294967295u, jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(jobId, 9u);
    EXPECT_TRUE(server.verify());
}

// ---- Transaction ------------------------------------------------------------------------------------

// Accepts a "JOB_REQUEST" of the result-port exchange: `before` and `after` surround the port and the
// address, which this side chooses. Everything else must match byte for byte.
FakeServer::Predicate transactFrame(Values before, Values after)
{
    return [before, after](const Bytes& payload) {
        const std::optional<ParsedRequest> parsed = parseRequest(payload);
        if (!parsed || parsed->values.size() < 2 + before.size() + 2) {
            return false;
        }
        const std::string port = parsed->values[2 + before.size()].second;
        const std::string host = parsed->values[3 + before.size()].second;
        if (port.empty() || port == "0" || port.find_first_not_of("0123456789") != std::string::npos || host.empty()) {
            return false;
        }
        Values expected = before;
        expected.emplace_back("requesterResultPort", port);
        expected.emplace_back("requesterHost", host);
        expected.insert(expected.end(), after.begin(), after.end());
        return payload == command("JOB_REQUEST", expected);
    };
}

TEST_F(TransformationManagerWire, TransactJobStringTrimsKeywordAndTakesResultFromTheResultPort)
{
    const Bytes result = "jobStatus=SUCCESS\0id=17\0result=0:done"s;
    server.expectFrameWhere("transact JOB_REQUEST",
                            transactFrame({{"keyword", "svc"}, {"request", "a b"}}, {{"d", "1"}}))
        .sendFrame(reply("SUCCESS", "accepted"))
        .connectBackAndSend(result);
    connect();
    ZELServerString text;
    StatusPtr status(manager.transactJobString(str(" svc "), str("  a b  "), list({"d", "1"}), text));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(text.str(), result);
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.connectionsAccepted(), 1);
}

TEST_F(TransformationManagerWire, TransactJobParsesTheResultAndSendsNotifications)
{
    ZELServerTransformationRequest job(str("svc"), str("R"), str("w.ext"));
    job.setDirective(str("priority"), str("2"));
    job.setNotification(str("A"), str("x"));
    server.expectFrameWhere("transact JOB_REQUEST",
                            transactFrame({{"keyword", "svc"}, {"request", emptyRequestText("R/w/w.ext")}},
                                          {{"priority", "2"}, {"notificationMsg", "A:x"}}))
        .sendFrame(reply("SUCCESS", "accepted"))
        .connectBackAndSend("jobStatus=SUCCESS\0id=17"s);
    connect();
    ZELServerTransformationResult result;
    StatusPtr status(manager.transactJob(job, result));
    EXPECT_EQ(status, nullptr) << messageOf(status);
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
    connect();

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

// ---- Abort and results ------------------------------------------------------------------------------

struct JobIdTextCase {
    unsigned jobId;
    const char* text;
};

class JobIdText : public TransformationManagerWire, public ::testing::WithParamInterface<JobIdTextCase> {};

TEST_P(JobIdText, AbortSendsTheIdAsSigned32BitNumber)
{
    server.exchange(command("ABORT_JOB_REQUEST", {{"jobID", GetParam().text}}), reply("SUCCESS", "true"));
    connect();
    StatusPtr status(manager.abortJob(GetParam().jobId));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_TRUE(server.verify());
}

const JobIdTextCase kJobIdTexts[] = {
    {0, "0"}, {7, "7"}, {2147483647u, "2147483647"}, {2147483648u, "-2147483648"}, {4294967295u, "-1"},
};

INSTANTIATE_TEST_SUITE_P(Table, JobIdText, ::testing::ValuesIn(kJobIdTexts),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST_F(TransformationManagerWire, AbortRefusedReturnsTheServersStatus)
{
    server.exchange(command("ABORT_JOB_REQUEST", {{"jobID", "5"}}), reply("ERROR", "job 5 is finished"));
    connect();
    StatusPtr status(manager.abortJob(5));
    ASSERT_NE(status, nullptr);
    EXPECT_STREQ(status->getMessage(), "job 5 is finished");
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, JobResultStringNullIsNotFound)
{
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "-1"}}), reply("SUCCESS", "null"));
    connect();
    unsigned found = kUntouched;
    ZELServerString text("before");
    StatusPtr status(manager.getJobResultString(4294967295u, found, text));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(found, 0u);
    EXPECT_EQ(text.str(), "before");
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, JobResultStringHandsOutTheWholeBody)
{
    const Bytes body = "id=12\0jobStatus=ABORTED\0description=null"s;
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "12"}}), reply("SUCCESS", body));
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "13"}}), reply("SUCCESS", "nul"));
    connect();
    unsigned found = 0;
    ZELServerString text;
    StatusPtr status(manager.getJobResultString(12, found, text));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(text.str(), body);

    found = 0;
    StatusPtr second(manager.getJobResultString(13, found, text));
    EXPECT_EQ(second, nullptr) << messageOf(second);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(text.str(), "nul");
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, JobResultStringFailureLeavesFoundAlone)
{
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "1"}}), reply("ERROR", "unknown job"));
    connect();
    unsigned found = kUntouched;
    ZELServerString text("before");
    StatusPtr status(manager.getJobResultString(1, found, text));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(found, kUntouched);
    EXPECT_EQ(text.str(), "before");
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, JobResultParsesRealTextAndEmptiesTextOnNull)
{
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "12"}}),
                    reply("SUCCESS", "id=12\0jobStatus=QUEUED\0result=3:Waiting"s));
    server.exchange(command("GET_JOB_RESULT_STRING", {{"jobID", "13"}}), reply("SUCCESS", "null"));
    connect();
    ZELServerTransformationResult result;
    unsigned found = 0;
    StatusPtr status(manager.getJobResult(12, found, result));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(found, 1u);
    unsigned code = 0;
    unsigned number = 0;
    EXPECT_EQ(result.getJobStatus(code), 1u);
    EXPECT_EQ(code, 1u);
    EXPECT_EQ(result.getStatusNumber(number), 1u);
    EXPECT_EQ(number, 3u);

    // No result: the object is parsed from an empty text, which keeps its properties.
    StatusPtr none(manager.getJobResult(13, found, result));
    EXPECT_EQ(none, nullptr) << messageOf(none);
    EXPECT_EQ(found, 0u);
    ZELServerString text("before");
    result.getText(text);
    EXPECT_EQ(text.str(), "");
    unsigned id = 0;
    EXPECT_EQ(result.getID(id), 1u);
    EXPECT_EQ(id, 12u);
    EXPECT_TRUE(server.verify());
}

// ---- Log files --------------------------------------------------------------------------------------

struct ExistsCase {
    const char* body;
    unsigned exists;
};

class LogFileExistsReply : public TransformationManagerWire, public ::testing::WithParamInterface<ExistsCase> {};

TEST_P(LogFileExistsReply, ReadsTheBodyAsBoolean)
{
    server.exchange(command("LOG_FILEEXISTS", {{"jobID", "-2"}}), reply("SUCCESS", GetParam().body));
    connect();
    unsigned exists = kUntouched;
    StatusPtr status(manager.logFileExists(4294967294u, exists));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(exists, GetParam().exists);
    EXPECT_TRUE(server.verify());
}

const ExistsCase kExistsCases[] = {
    {"true", 1}, {"false", 0}, {"True", kUntouched}, {"true ", kUntouched}, {"1", kUntouched},
};

INSTANTIATE_TEST_SUITE_P(Table, LogFileExistsReply, ::testing::ValuesIn(kExistsCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST_F(TransformationManagerWire, LogFileInfoReadsTheDescription)
{
    server.exchange(command("LOG_GET_FILEINFO", {{"jobID", "4"}}),
                    reply("SUCCESS", R"(<LOG_GET_FILEINFO><LOGFILEINFO size="120"/></LOG_GET_FILEINFO>)"));
    connect();
    ZELServerLogFileInfo info;
    unsigned found = kUntouched;
    StatusPtr status(manager.getLogFileInfo(4, info, found));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(info.getSize(), 120u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, LogFileInfoWithoutDescriptionIsStillFound)
{
    server.exchange(command("LOG_GET_FILEINFO", {{"jobID", "4"}}), reply("SUCCESS", "<LOG_GET_FILEINFO/>"));
    connect();
    ZELServerLogFileInfo info;
    unsigned found = kUntouched;
    StatusPtr status(manager.getLogFileInfo(4, info, found));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(found, 1u);
    EXPECT_EQ(info.getSize(), 4294967295u);
    EXPECT_TRUE(server.verify());
}

TEST_F(TransformationManagerWire, LogFileInfoUnreadableReplyIsNoFailure)
{
    server.exchange(command("LOG_GET_FILEINFO", {{"jobID", "4"}}), reply("SUCCESS", "no log here"));
    server.exchange(command("LOG_GET_FILEINFO", {{"jobID", "5"}}), reply("ERROR", "log store offline"));
    connect();
    ZELServerLogFileInfo info;
    unsigned found = kUntouched;
    StatusPtr status(manager.getLogFileInfo(4, info, found));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(found, 0u);

    // A failed exchange is the only failure; found was cleared before sending.
    found = kUntouched;
    StatusPtr failed(manager.getLogFileInfo(5, info, found));
    ASSERT_NE(failed, nullptr);
    EXPECT_STREQ(failed->getMessage(), "log store offline");
    EXPECT_EQ(found, 0u);
    EXPECT_EQ(info.getSize(), 4294967295u);
    EXPECT_TRUE(server.verify());
}

class LogDownload : public TransformationManagerWire {
protected:
    void SetUp() override
    {
        TransformationManagerWire::SetUp();
        path = (directory / "job.log").string();
    }

    static std::optional<std::string> contentOf(const std::string& file)
    {
        std::ifstream in(file, std::ios::binary);
        if (!in) {
            return std::nullopt;
        }
        return std::string(std::istreambuf_iterator<char>(in), {});
    }

    Bytes logCommand(const char* jobId) const
    {
        return command("LOG_GET_FILE", {{"jobID", jobId}, {"logFileCRCCheckingEnabled", "false"}});
    }

    const zeltest::TempDir scratch{"zel-jobs"};
    const fs::path& directory = scratch.path();
    std::string path;
};

TEST_F(LogDownload, ReceivesTheLogIntoTheLocalFile)
{
    const Bytes content = "line one\nline two\0binary\n"s;
    server.expectFrame(logCommand("-1"))
        .sendFrame(fileHeader(content.size(), crc32(content)))
        .expectFrame(readyAck())
        .sendRaw(content)
        .expectFrame(readyAck())
        .sendFrame(reply("SUCCESS", "true"));
    connect();
    unsigned success = kUntouched;
    StatusPtr status(manager.getLogFile(4294967295u, str(path), success));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(success, 1u);
    EXPECT_EQ(contentOf(path), content);
    EXPECT_TRUE(server.verify());
}

TEST_F(LogDownload, AnswerFalseAfterTheContentDeletesTheLocalFile)
{
    const Bytes content = "partial";
    server.expectFrame(logCommand("3"))
        .sendFrame(fileHeader(content.size(), crc32(content)))
        .expectFrame(readyAck())
        .sendRaw(content)
        .expectFrame(readyAck())
        .sendFrame(reply("SUCCESS", "false"));
    connect();
    unsigned success = kUntouched;
    StatusPtr status(manager.getLogFile(3, str(path), success));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(success, 0u);
    EXPECT_FALSE(fs::exists(path));
    EXPECT_TRUE(server.verify());
}

TEST_F(LogDownload, ServerWithoutALogLeavesNoFileBehind)
{
    // A first frame that is no file header ends the exchange; the channel reads it as "false".
    server.expectFrame(logCommand("3")).sendFrame(reply("SUCCESS", "false"));
    server.expectFrame(logCommand("4")).sendFrame(reply("ERROR", "no log for job 4"));
    connect();
    std::ofstream(path) << "an older log";
    unsigned success = kUntouched;
    StatusPtr status(manager.getLogFile(3, str(path), success));
    EXPECT_EQ(status, nullptr) << messageOf(status);
    EXPECT_EQ(success, 0u);
    EXPECT_FALSE(fs::exists(path));

    success = kUntouched;
    StatusPtr refused(manager.getLogFile(4, str(path), success));
    EXPECT_EQ(refused, nullptr) << messageOf(refused);
    EXPECT_EQ(success, 0u);
    EXPECT_FALSE(fs::exists(path));
    EXPECT_TRUE(server.verify());
}

TEST_F(LogDownload, UnwritablePathFailsBeforeAnythingIsSent)
{
    connect();
    const std::string missing = (directory / "no-such-folder" / "job.log").string();
    for (const std::string& target : {missing, directory.string()}) {
        unsigned success = kUntouched;
        StatusPtr status(manager.getLogFile(3, str(target), success));
        ASSERT_NE(status, nullptr);
        EXPECT_EQ(status->getMessageNumber(), msg::kLocalFileWrite);
        EXPECT_EQ(messageOf(status), "The local file \"" + target + "\" cannot be written.");
        EXPECT_EQ(success, kUntouched);
    }
    EXPECT_TRUE(server.verify());
    EXPECT_EQ(server.frames().size(), 1u);  // the sign-in only
}

TEST_F(LogDownload, BrokenTransferKeepsThePartlyWrittenFile)
{
    server.expectFrame(logCommand("3"))
        .sendFrame(fileHeader(10, 0))
        .expectFrame(readyAck())
        .sendRaw("abcd")
        .closeConnection();
    connect();
    unsigned success = kUntouched;
    StatusPtr status(manager.getLogFile(3, str(path), success));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kReceiveFailed);
    EXPECT_EQ(success, kUntouched);
    EXPECT_TRUE(fs::exists(path));
    EXPECT_TRUE(server.verify());
}

// ---- Input checks -----------------------------------------------------------------------------------

// The channel is never opened: a check that let a command through would fail with a send error.
class TransformationManagerChecks : public ::testing::Test {
protected:
    ZELServerTCPIPChannel channel;
    ZELServerTransformationManager manager{&channel};
};

struct CheckCase {
    const char* what;
    std::string keyword;
    std::string requestText;
    std::string submitMessage;    // also schedule
    std::string transactMessage;
};

class JobInputCheck : public TransformationManagerChecks, public ::testing::WithParamInterface<CheckCase> {};

std::string invalid(const std::string& name, const std::string& value)
{
    return "The argument \"" + name + "\" has an invalid value: \"" + value + "\".";
}

TEST_P(JobInputCheck, RefusesBeforeAnythingIsSent)
{
    const CheckCase& c = GetParam();
    SCOPED_TRACE(c.what);
    unsigned jobId = kUntouched;
    ZELServerString resultText("before");
    const StatusPtr statuses[] = {
        StatusPtr(manager.submitJobString(str(c.keyword), str(c.requestText), ZELServerStringArray(), jobId)),
        StatusPtr(manager.scheduleJobString(str(c.keyword), str(c.requestText), 5, ZELServerStringArray(), jobId)),
        StatusPtr(manager.submitJob(FixedRequest(c.keyword, c.requestText, {}, {}), jobId)),
        StatusPtr(manager.transactJobString(str(c.keyword), str(c.requestText), ZELServerStringArray(), resultText)),
    };
    const std::string expected[] = {c.submitMessage, c.submitMessage, c.submitMessage, c.transactMessage};
    for (std::size_t i = 0; i < std::size(statuses); ++i) {
        ASSERT_NE(statuses[i], nullptr) << i;
        EXPECT_EQ(statuses[i]->getMessageNumber(), msg::kInvalidArgument) << i;
        EXPECT_EQ(messageOf(statuses[i]), expected[i]) << i;
    }
    EXPECT_EQ(jobId, kUntouched);
    EXPECT_EQ(resultText.str(), "before");
}

const CheckCase kCheckCases[] = {
    {"keyword of spaces", "   ", "r", invalid("subsectionName", "   "), invalid("keyword", "   ")},
    {"empty keyword", "", "r", invalid("subsectionName", ""), invalid("keyword", "")},
    {"keyword holding NUL", "a\0b"s, "r", invalid("subsectionName", "a"), invalid("keyword", "a")},
    {"request of spaces", " k ", "  ", invalid("request", "  "), invalid("request", "  ")},
    {"empty request", "k", "", invalid("request", ""), invalid("request", "")},
    {"request holding NUL", "k", "x\0y"s, invalid("request", "x"), invalid("request", "x")},
    {"keyword checked first", " ", " ", invalid("subsectionName", " "), invalid("keyword", " ")},
};

INSTANTIATE_TEST_SUITE_P(Table, JobInputCheck, ::testing::ValuesIn(kCheckCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST_F(TransformationManagerChecks, OnlySpacesAreTrimmed)
{
    // A tab is part of the keyword: the check passes and the command reaches the (closed) channel.
    unsigned jobId = kUntouched;
    StatusPtr status(manager.submitJobString(str("\t"), str("r\n"), ZELServerStringArray(), jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->getMessageNumber(), msg::kSendFailed);
    EXPECT_EQ(jobId, kUntouched);
}

TEST_F(TransformationManagerChecks, TransactThroughTheBaseInterfaceIsTheSameOperation)
{
    IZELServerBaseTransformationManager& base = manager;
    ZELServerTransformationResult result;
    StatusPtr viaBase(base.transactJob(FixedRequest(" ", "r", {}, {}), result));
    ASSERT_NE(viaBase, nullptr);
    EXPECT_EQ(messageOf(viaBase), invalid("keyword", " "));

    ZELServerString text("before");
    StatusPtr viaBaseString(base.transactJobString(str("k"), str(" "), ZELServerStringArray(), text));
    ASSERT_NE(viaBaseString, nullptr);
    EXPECT_EQ(messageOf(viaBaseString), invalid("request", " "));
    EXPECT_EQ(manager.reserved(), 0u);
}

TEST_F(TransformationManagerChecks, RequestTextThatCannotBeComposedIsRefused)
{
    ZELServerTransformationRequest job(str("svc"), str("p"));
    job.setPublishedParameter(str("P"), str("a\0b"s));
    unsigned jobId = kUntouched;
    StatusPtr status(manager.submitJob(job, jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(messageOf(status), invalid("request", ""));
}

TEST_F(TransformationManagerChecks, FactoryNeedsAChannel)
{
    EXPECT_EQ(makeTransformationManager(nullptr), nullptr);
    std::unique_ptr<IZELServerTransformationManager> made(makeTransformationManager(&channel));
    ASSERT_NE(made, nullptr);
    unsigned jobId = 0;
    StatusPtr status(made->submitJobString(str(""), str("r"), ZELServerStringArray(), jobId));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(messageOf(status), invalid("subsectionName", ""));
}

}  // namespace
}  // namespace zel
