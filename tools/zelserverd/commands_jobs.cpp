// Jobs and their logs: "JOB_REQUEST", "ABORT_JOB_REQUEST", "GET_JOB_RESULT_STRING" and the
// three "LOG_" commands.
#include <fcntl.h>
#include <sys/stat.h>

#include "commands.h"
#include "jobs.h"
#include "server.h"
#include "transfer.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace {

// The job a command names: the failure reply, or nothing with `id` set. Clients write job ids
// as signed 32-bit decimals, so 4294967295 arrives as -1.
std::optional<Reply> resolveJob(CommandContext& context, std::int64_t& id)
{
    Reply failure;
    auto text = context.required("jobID", failure);
    if (!text)
        return failure;
    auto value = parseSigned(*text);
    if (!value || *value < INT32_MIN || *value > static_cast<std::int64_t>(UINT32_MAX))
        return Reply::error("bad job id '" + *text + "'");
    id = static_cast<std::int64_t>(static_cast<std::uint32_t>(*value));
    return std::nullopt;
}

Reply jobRequest(CommandContext& context)
{
    Reply failure;
    JobSubmission submission;
    auto keyword = context.required("keyword", failure);
    if (!keyword)
        return failure;
    auto request = context.required("request", failure);
    if (!request)
        return failure;
    submission.keyword = *keyword;
    submission.request = *request;
    submission.user = context.principal().user;
    if (const std::string* delay = context.request.find("secondsFromNow")) {
        auto seconds = parseDecimal(*delay, UINT32_MAX);
        if (!seconds)
            return Reply::error("bad secondsFromNow '" + *delay + "'");
        submission.delaySeconds = static_cast<std::uint32_t>(*seconds);
    }
    // The result-port exchange puts the port it actually bound first; a caller's own
    // "requesterResultPort" directive may follow and is not the one to use.
    const std::string* port = context.request.find("requesterResultPort");
    const std::string* host = context.request.find("requesterHost");
    if ((port != nullptr) != (host != nullptr))
        return Reply::error("requesterResultPort and requesterHost go together");
    if (port) {
        auto number = parseDecimal(*port, 65535);
        if (!number || *number == 0 || host->empty())
            return Reply::error("bad result address '" + *host + ":" + *port + "'");
        submission.requesterHost = *host;
        submission.requesterPort = static_cast<std::uint16_t>(*number);
    }
    submission.notifications = context.request.all("notificationMsg");
    std::string error;
    std::int64_t id = context.server.jobs->submit(submission, error);
    if (id == 0)
        return Reply::error(error);
    return Reply::ok(std::to_string(id));
}

Reply abortJob(CommandContext& context)
{
    std::int64_t id = 0;
    if (auto failure = resolveJob(context, id))
        return *failure;
    std::string error = context.server.jobs->abort(id, context.principal().user);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply jobResult(CommandContext& context)
{
    std::int64_t id = 0;
    if (auto failure = resolveJob(context, id))
        return *failure;
    std::optional<std::string> text = context.server.jobs->resultText(id);
    return Reply::ok(text ? *text : "null");
}

Reply logExists(CommandContext& context)
{
    std::int64_t id = 0;
    if (auto failure = resolveJob(context, id))
        return *failure;
    struct stat info {};
    return Reply::boolean(::stat(context.server.jobs->logPath(id).c_str(), &info) == 0);
}

Reply logInfo(CommandContext& context)
{
    std::int64_t id = 0;
    if (auto failure = resolveJob(context, id))
        return *failure;
    struct stat info {};
    if (::stat(context.server.jobs->logPath(id).c_str(), &info) != 0)
        return Reply::error("job " + std::to_string(id) + " has no log");
    return Reply::ok(replyDocument("LOG_GET_FILEINFO", [&](pugi::xml_node root) {
        root.append_child("LOGFILEINFO").append_attribute("size") =
            std::to_string(static_cast<unsigned long long>(info.st_size)).c_str();
    }));
}

Reply logFile(CommandContext& context)
{
    std::int64_t id = 0;
    if (auto failure = resolveJob(context, id))
        return *failure;
    // The log of a running job keeps growing; the transfer sends what is there when it starts.
    UniqueFd fd(::open(context.server.jobs->logPath(id).c_str(), O_RDONLY | O_CLOEXEC));
    if (!fd.valid())
        return Reply::error("job " + std::to_string(id) + " has no log");
    std::string message;
    TransferOutcome outcome = sendDownload(context.io, fd.get(), message);
    if (outcome == TransferOutcome::Lost)
        return Reply::close();
    if (outcome == TransferOutcome::Refused)
        return Reply::error(message);
    return Reply::ok();
}

}  // namespace

std::vector<CommandSpec> jobCommands()
{
    return {
        {"JOB_REQUEST", kRightJobs, jobRequest},          {"ABORT_JOB_REQUEST", kRightJobs, abortJob},
        {"GET_JOB_RESULT_STRING", kRightJobs, jobResult}, {"LOG_FILEEXISTS", kRightJobs, logExists},
        {"LOG_GET_FILEINFO", kRightJobs, logInfo},        {"LOG_GET_FILE", kRightJobs, logFile},
    };
}

}  // namespace zelserverd
