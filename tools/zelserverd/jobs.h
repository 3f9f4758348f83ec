// Jobs: a workspace run by /bin/sh in its own working directory and process group, under a
// supervisor that kills everything the job started when it ends, on a pool of workers with one
// queue. Every job is recorded in the database and leaves a log in
// DATA/jobs/ID/job.log that holds the server's own lines ("zelserverd: ...") and the run's
// standard output and error. Jobs that a client transacts get their result text delivered on a
// new connection to the client's result port.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <thread>
#include <utility>
#include <vector>

#include "config.h"
#include "logger.h"
#include "repository_store.h"
#include "store.h"

namespace zelserverd {

// The request text: "REPOSITORY/NAME/NAME.zlw -XML_PARAMETER <TRANSFORMATION_REQUEST>...".
struct JobRequestText {
    std::string workspacePath;
    std::string repository;
    std::string itemName;
    std::vector<std::pair<std::string, std::string>> parameters;  // "PUBLISHED_PARAMETER"
    std::vector<std::pair<std::string, std::string>> directives;  // "ZEL_DIRECTIVE"
};
// Empty on success, else why the text is refused.
std::string parseJobRequestText(std::string_view text, JobRequestText& out);

// Result numbers beyond a workspace's own exit status (1 to 255).
enum JobResultNumber : std::int64_t {
    kResultSuccess = 0,
    kResultSignal = 1001,   // the workspace ended by a signal
    kResultAborted = 1002,  // ABORT_JOB_REQUEST
    kResultTimeout = 1003,  // job_timeout_seconds passed
    kResultNotRun = 1004,   // the server could not start the workspace
    kResultStopped = 1005,  // the server stopped first
};

struct JobSubmission {
    std::string keyword;
    std::string request;
    std::string user;
    std::uint32_t delaySeconds = 0;
    std::string requesterHost;  // both empty: no result delivery
    std::uint16_t requesterPort = 0;
    std::vector<std::string> notifications;
};

class JobManager {
public:
    JobManager(Database& db, RepositoryStore& repos, Logger& log, const Config& config, std::string jobsDir);
    JobManager(const JobManager&) = delete;
    JobManager& operator=(const JobManager&) = delete;
    ~JobManager();

    // Creates the jobs directory and closes the books on jobs that an earlier run left
    // unfinished (they become ABORTED).
    std::string open();
    void start();
    // Kills running jobs, aborts queued ones, joins the workers. Safe to call more than once.
    void stop();

    // Checks, records and queues a job; its id, or 0 with `error` set.
    std::int64_t submit(const JobSubmission& submission, std::string& error);
    // Ends a queued or running job and waits until it is recorded as ended. Empty on success.
    std::string abort(std::int64_t id, const std::string& user);
    // The result text (NUL-separated name=value), also for jobs not finished yet; nullopt for
    // an unknown job.
    std::optional<std::string> resultText(std::int64_t id);
    std::string logPath(std::int64_t id) const;
    // The user who submitted a job; nullopt for an unknown job.
    std::optional<std::string> owner(std::int64_t id);

private:
    struct Job;
    void worker();
    std::shared_ptr<Job> nextDue(std::chrono::steady_clock::time_point now);
    void run(Job& job);
    pid_t spawn(Job& job, std::string& error);
    bool waitForExit(pid_t pid);
    void finish(const std::shared_ptr<Job>& job, std::string_view status, std::int64_t number,
                const std::string& message);
    void deliver(const Job& job, const std::string& text);
    void logLine(std::int64_t id, const std::string& line);
    std::string prepare(Job& job, const JobSubmission& submission, int workspaceFd);

    Database& db_;
    RepositoryStore& repos_;
    Logger& log_;
    const Config& config_;
    std::string dir_;
    std::mutex mutex_;
    std::condition_variable wake_;   // workers: a job arrived, came due, or stop
    std::condition_variable ended_;  // abort: a job was recorded as ended
    std::map<std::int64_t, std::shared_ptr<Job>> active_;
    struct JobAccount {
        uid_t uid;
        gid_t gid;
    };
    std::optional<JobAccount> jobAccount_;  // set when the server runs as root
    std::vector<std::thread> workers_;
    bool stopping_ = false;
};

// The NUL-separated result text of a job record.
struct JobRecord {
    std::int64_t id = 0;
    std::string keyword;
    std::string request;
    std::string status;
    std::string timeRequested;
    std::string timeStarted;
    std::string timeFinished;
    std::int64_t resultNumber = -1;  // -1: no result yet
    std::string resultMessage;
    std::string requesterHost;
    std::string requesterPort;
};
std::string formatResult(const JobRecord& record);

}  // namespace zelserverd
