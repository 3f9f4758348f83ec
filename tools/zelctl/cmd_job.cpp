// job: submit, run, schedule, abort, result, wait and log.

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <random>
#include <thread>

#include "commands.h"
#include "progress.h"

namespace zelctl {

namespace {

// The words of the job status codes, in code order.
const char* const kStatusWords[] = {"SUBMITTED", "QUEUED",  "DELAYED",     "PAUSED",      "IN_PROCESS", "DELETED",
                                    "ABORTED",   "SUCCESS", "ZEL_FAILURE", "JOB_FAILURE", "PULLED"};

std::string statusWord(unsigned code)
{
    return code < std::size(kStatusWords) ? kStatusWords[code] : std::to_string(code);
}

// A job is still going while its code is one of SUBMITTED through IN_PROCESS.
bool stillGoing(unsigned code) { return code <= 4; }

struct RequestArguments {
    std::string service;
    std::string repository;
    std::string workspace;
    std::vector<std::string> parameters;
    std::vector<std::string> directives;
    std::vector<std::string> notifications;
};

void addRequestOptions(CLI::App* command, RequestArguments& arguments)
{
    command->add_option("SERVICE", arguments.service, "Job service keyword, e.g. zeljob")->required();
    command->add_option("REPOSITORY", arguments.repository, "Repository of the workspace")->required();
    command->add_option("WORKSPACE", arguments.workspace, "Workspace item")->required();
    command->add_option("-p,--parameter", arguments.parameters, "Published parameter NAME=VALUE");
    command->add_option("-d,--directive", arguments.directives, "Directive NAME=VALUE");
    command->add_option("--notify", arguments.notifications, "Notification TOPIC=MESSAGE");
}

// Builds the request from the command line; null with a complaint when an entry is no NAME=VALUE.
Outcome buildRequest(Connection& connection, const RequestArguments& arguments,
                     ZELServerOwned<IZELServerTransformationRequest>& request)
{
    request = connection.own(connection.session().createTransformationRequest(connection.text(arguments.service),
                                                                              connection.text(arguments.repository),
                                                                              connection.text(arguments.workspace)));
    if (!request)
        return complaint("out of memory for the job request");
    using Setter = void (IZELServerTransformationRequest::*)(const IZELServerString&, const IZELServerString&);
    const std::pair<const std::vector<std::string>*, Setter> lists[] = {
        {&arguments.parameters, &IZELServerTransformationRequest::setPublishedParameter},
        {&arguments.directives, &IZELServerTransformationRequest::setDirective},
        {&arguments.notifications, &IZELServerTransformationRequest::setNotification},
    };
    for (const auto& [list, setter] : lists) {
        for (const std::string& entry : *list) {
            const auto pair = splitPair(entry);
            if (!pair)
                return complaint("expected NAME=VALUE, got '" + entry + "'");
            (request.get()->*setter)(connection.text(pair->first), connection.text(pair->second));
        }
    }
    return std::nullopt;
}

using Result = ZELServerOwned<IZELServerTransformationResult>;

Result newResult(Connection& connection) { return connection.own(connection.session().createTransformationResult()); }

nlohmann::ordered_json describe(Connection& connection, const IZELServerTransformationResult& result)
{
    unsigned id = 0;
    unsigned code = 0;
    result.getID(id);
    const bool hasCode = result.getJobStatus(code) != 0;
    return {{"job", id},
            {"status", hasCode ? statusWord(code) : ""},
            {"success", result.isSuccess() != 0},
            {"message", connection.read(result, &IZELServerTransformationResult::getStatusMessage)},
            {"result", connection.read(result, &IZELServerTransformationResult::getResult)},
            {"requested", connection.read(result, &IZELServerTransformationResult::getTimeRequested)},
            {"started", connection.read(result, &IZELServerTransformationResult::getTimeStarted)},
            {"finished", connection.read(result, &IZELServerTransformationResult::getTimeFinished)}};
}

// How an ended job ends zelctl: the job's own failure or abort has an exit status of its own.
Outcome jobOutcome(unsigned code, bool success)
{
    constexpr unsigned kDeleted = 5, kAborted = 6;
    if (code == kAborted || code == kDeleted)
        return Failure{0, "", kExitJobAborted};
    if (!success)
        return Failure{0, "", kExitJobFailed};
    return std::nullopt;
}

Outcome submit(Context& context, const RequestArguments& arguments, const unsigned* delay, unsigned& id)
{
    ZELServerOwned<IZELServerTransformationRequest> request;
    if (Outcome failure = buildRequest(context.connection, arguments, request))
        return failure;
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    return context.connection.check(delay ? jobs->scheduleJob(*request, *delay, id) : jobs->submitJob(*request, id));
}

Outcome submitAndShow(Context& context, const RequestArguments& arguments, const unsigned* delay)
{
    unsigned id = 0;
    if (Outcome failure = submit(context, arguments, delay, id))
        return failure;
    if (context.output.json())
        context.output.print({{"job", id}});
    else
        context.output.print(std::to_string(id));
    return std::nullopt;
}

// Fetches the job's result; a job the server does not know is a failure.
Outcome fetch(Context& context, unsigned id, const Result& result, unsigned& code)
{
    if (!result)
        return complaint("out of memory for the job result");
    unsigned found = 0;
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    if (Outcome failure = context.connection.check(jobs->getJobResult(id, found, *result)))
        return failure;
    if (!found)
        return complaint("no job " + std::to_string(id));
    code = 0;
    result->getJobStatus(code);
    return std::nullopt;
}

// Asks for the job's result until it has ended, then shows it. `limit` seconds (0: none) bound the wait.
Outcome wait(Context& context, unsigned id, unsigned limit)
{
    const bool spin = !context.output.quiet() && stderrIsTerminal();
    const char spinner[] = {'|', '/', '-', '\\'};
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(limit);
    const Result result = newResult(context.connection);
    unsigned code = 0;
    for (unsigned turn = 0;; ++turn) {
        if (Outcome failure = fetch(context, id, result, code))
            return failure;
        if (!stillGoing(code))
            break;
        if (limit != 0 && std::chrono::steady_clock::now() >= deadline)
            return Failure{
                0, "job " + std::to_string(id) + " is still " + statusWord(code) + " after " + secondsText(limit),
                kExitTimedOut};
        if (spin) {
            std::fprintf(stderr, "\rjob %u %s %c ", id, statusWord(code).c_str(), spinner[turn % 4]);
            std::fflush(stderr);
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
    }
    if (spin)
        std::fputs("\r\033[K", stderr);
    context.output.print(describe(context.connection, *result));
    return jobOutcome(code, result->isSuccess() != 0);
}

// Submits and waits. The ID goes to standard error at once, so the job can be aborted from elsewhere
// while standard output keeps only the result.
Outcome runJob(Context& context, const RequestArguments& arguments, unsigned limit)
{
    unsigned id = 0;
    if (Outcome failure = submit(context, arguments, nullptr, id))
        return failure;
    if (!context.output.quiet())
        std::cerr << "job " << id << " submitted" << std::endl;
    return wait(context, id, limit);
}

// A file of our own in the temporary folder, removed when the holder goes.
struct ScratchFile {
    ScratchFile()
    {
        std::random_device random;
        path = std::filesystem::temp_directory_path() / ("zelctl-" + std::to_string(random()) + ".log");
    }
    ~ScratchFile()
    {
        std::error_code ignored;
        std::filesystem::remove(path, ignored);
    }
    ScratchFile(const ScratchFile&) = delete;
    ScratchFile& operator=(const ScratchFile&) = delete;
    std::filesystem::path path;
};

Outcome download(Context& context, unsigned id, const std::filesystem::path& target)
{
    unsigned success = 0;
    IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
    if (Outcome failure =
            context.connection.check(jobs->getLogFile(id, context.connection.text(target.string()), success)))
        return failure;
    if (!success)
        return complaint("no log for job " + std::to_string(id));
    return std::nullopt;
}

std::string contentOf(const std::filesystem::path& file)
{
    std::ifstream in(file, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

Outcome log(Context& context, unsigned id, const std::string& file)
{
    if (!file.empty()) {
        if (Outcome failure = download(context, id, file))
            return failure;
        context.output.done("downloaded", {{"job", id}, {"file", file}});
        return std::nullopt;
    }
    const ScratchFile scratch;
    if (Outcome failure = download(context, id, scratch.path))
        return failure;
    if (context.output.json()) {
        context.output.print({{"job", id}, {"log", contentOf(scratch.path)}});
    } else {
        std::cout << contentOf(scratch.path);
        std::cout.flush();
    }
    return std::nullopt;
}

// Prints the log as it grows until the job has ended; ends like `job wait`. The status is asked before
// the log, so the last log fetched after the job ended is the whole of it.
Outcome follow(Context& context, unsigned id)
{
    if (context.output.json())
        return Failure{0, "--follow writes the log as text; leave out --json", kExitUsage};
    const ScratchFile scratch;
    const Result result = newResult(context.connection);
    std::size_t shown = 0;
    for (;;) {
        unsigned code = 0;
        if (Outcome failure = fetch(context, id, result, code))
            return failure;
        unsigned success = 0;
        IZELServerTransformationManager* jobs = context.connection.session().getTransformationManager();
        if (Outcome failure =
                context.connection.check(jobs->getLogFile(id, context.connection.text(scratch.path.string()), success)))
            return failure;
        const std::string text = success ? contentOf(scratch.path) : std::string();
        if (text.size() > shown) {
            std::cout << text.substr(shown);
            std::cout.flush();
            shown = text.size();
        }
        if (!stillGoing(code))
            return jobOutcome(code, result->isSuccess() != 0);
        std::this_thread::sleep_for(std::chrono::milliseconds(500));
    }
}

struct JobArguments {
    unsigned id = 0;
    unsigned limit = 0;
    std::string file;
    bool follow = false;
};

void addIdOption(CLI::App* command, JobArguments& arguments)
{
    command->add_option("ID", arguments.id, "Job ID, as job submit printed it")->required();
}

}  // namespace

void addJobCommands(CLI::App& app, Action& chosen)
{
    auto* job = app.add_subcommand("job", "Submit, run and follow jobs");
    job->require_subcommand(1);
    auto a = std::make_shared<JobArguments>();
    const char* waitLimit = "Give up after SECONDS (exit status 5); the global --timeout goes before the command";

    auto submitArguments = std::make_shared<RequestArguments>();
    auto* submitCommand = job->add_subcommand("submit", "Submit a job; prints its ID");
    addRequestOptions(submitCommand, *submitArguments);
    on(submitCommand, chosen, [submitArguments](Context& c) { return submitAndShow(c, *submitArguments, nullptr); });

    auto runArguments = std::make_shared<RequestArguments>();
    auto* runCommand = job->add_subcommand("run", "Submit a job and wait for its result; exits with its outcome");
    addRequestOptions(runCommand, *runArguments);
    runCommand->add_option("--timeout", a->limit, waitLimit);
    on(runCommand, chosen, [runArguments, a](Context& c) { return runJob(c, *runArguments, a->limit); });

    auto scheduleArguments = std::make_shared<RequestArguments>();
    auto delay = std::make_shared<unsigned>(0);
    auto* scheduleCommand = job->add_subcommand("schedule", "Submit a job to start SECONDS from now");
    scheduleCommand->add_option("SECONDS", *delay, "Delay in seconds")->required();
    addRequestOptions(scheduleCommand, *scheduleArguments);
    on(scheduleCommand, chosen,
       [scheduleArguments, delay](Context& c) { return submitAndShow(c, *scheduleArguments, delay.get()); });

    auto* abortCommand = job->add_subcommand("abort", "Abort a job");
    addIdOption(abortCommand, *a);
    on(abortCommand, chosen, [a](Context& c) -> Outcome {
        if (Outcome failure = c.connection.check(c.connection.session().getTransformationManager()->abortJob(a->id)))
            return failure;
        c.output.done("aborted", {{"job", a->id}});
        return std::nullopt;
    });

    auto* resultCommand = job->add_subcommand("result", "Show a job's result so far");
    addIdOption(resultCommand, *a);
    on(resultCommand, chosen, [a](Context& c) -> Outcome {
        const Result result = newResult(c.connection);
        unsigned code = 0;
        if (Outcome failure = fetch(c, a->id, result, code))
            return failure;
        c.output.print(describe(c.connection, *result));
        return std::nullopt;
    });

    auto* waitCommand = job->add_subcommand("wait", "Wait until a job has ended; exits with its outcome");
    addIdOption(waitCommand, *a);
    waitCommand->add_option("--timeout", a->limit, waitLimit);
    on(waitCommand, chosen, [a](Context& c) { return wait(c, a->id, a->limit); });

    auto* logCommand = job->add_subcommand("log", "Fetch a job's log");
    addIdOption(logCommand, *a);
    auto* output = logCommand->add_option("-o,--output", a->file, "Write the log to FILE instead of standard output");
    logCommand->add_flag("-f,--follow", a->follow, "Print the log as it grows until the job ends; exits as job wait")
        ->excludes(output);
    on(logCommand, chosen, [a](Context& c) { return a->follow ? follow(c, a->id) : log(c, a->id, a->file); });
}

}  // namespace zelctl
