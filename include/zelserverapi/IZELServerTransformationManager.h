#pragma once
// The entry to the server's job service: run a job and wait for its result (transact), queue it
// (submit) or queue it a number of seconds ahead (schedule), abort it, fetch its result later, and
// reach its log file. Owned by the session (IZELServerSession::getTransformationManager); never
// destroy it yourself.
//
// Every operation is one exchange with the server and returns null on success or a status that the
// caller destroys with IZELServerSession::destroyStatus. Statuses of the connection (for example 393625
// with the server's message, 393607 or 393608 when the connection fails) are returned unchanged.
//
// The job-running operations check their keyword and request text, trimmed of spaces, before anything
// is sent: an empty text, or one holding a NUL, gives 393617 with the parameter name and the text as
// given ("keyword" for the transact operations, "subsectionName" for submit and schedule; "request"
// for the request text). Directive and notification lists are flat pair lists (name, value, ...; an
// odd last entry is ignored). Job IDs are 32-bit; the server sees them as signed numbers.

#include "IZELServerLogFileInfo.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerStringArray.h"
#include "IZELServerTransformationRequest.h"
#include "IZELServerTransformationResult.h"

// The synchronous half of the manager: the operations that wait for the finished job, whose result the
// server delivers on a connection of its own to a port this client listens on.
class IZELServerBaseTransformationManager {
public:
    // Runs the job and parses the server's result text into `result`; on failure `result` is not
    // touched. The result comes on a connection the server makes back to a port this client listens
    // on, and the call waits for it: without the connection property "RESULT_PORT_TIMEOUT" for as
    // long as the server takes (a server that never calls back blocks the caller); with it, up to
    // that many seconds, then 393618 with getCode() 392012. 393618 with code 0 when the port cannot
    // be opened or the call cannot be accepted; the result frame itself is read as any reply
    // ("IO_TIMEOUT", "MAX_REPLY_BYTES"; 393608 when it breaks off).
    virtual IZELServerStatus* transactJob(const IZELServerTransformationRequest& request,
                                          IZELServerTransformationResult& result) = 0;
    // Runs the job without notifications and writes the result text into `resultText`, on failure too
    // (then whatever reply there was, possibly nothing).
    virtual IZELServerStatus* transactJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                                const IZELServerStringArray& directives,
                                                IZELServerString& resultText) = 0;
    virtual ~IZELServerBaseTransformationManager() = default;

protected:
    IZELServerBaseTransformationManager() = default;
    IZELServerBaseTransformationManager(const IZELServerBaseTransformationManager&) = delete;
    IZELServerBaseTransformationManager& operator=(const IZELServerBaseTransformationManager&) = delete;
};

class IZELServerTransformationManager {
public:
    // As IZELServerBaseTransformationManager.
    virtual IZELServerStatus* transactJob(const IZELServerTransformationRequest& request,
                                          IZELServerTransformationResult& result) = 0;
    virtual IZELServerStatus* transactJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                                const IZELServerStringArray& directives,
                                                IZELServerString& resultText) = 0;

    // Queues the job and writes the ID the server gave it into `jobId` (left as it was when the reply
    // holds no number). The keyword is sent as given, the request text trimmed.
    virtual IZELServerStatus* submitJob(const IZELServerTransformationRequest& request, unsigned& jobId) = 0;
    // As submitJob, without notifications.
    virtual IZELServerStatus* submitJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                              const IZELServerStringArray& directives, unsigned& jobId) = 0;

    // Queues the job to start `secondsFromNow` seconds ahead: a submission whose directives hold
    // "secondsFromNow", replacing one the caller gave. The request's notifications are not sent.
    virtual IZELServerStatus* scheduleJob(const IZELServerTransformationRequest& request, unsigned secondsFromNow,
                                          unsigned& jobId) = 0;
    virtual IZELServerStatus* scheduleJobString(const IZELServerString& keyword, const IZELServerString& requestText,
                                                unsigned secondsFromNow, const IZELServerStringArray& directives,
                                                unsigned& jobId) = 0;

    virtual IZELServerStatus* abortJob(unsigned jobId) = 0;

    // Fetches the result of a finished job. `found` is 0 when the server has no result ("null"); the
    // result is then parsed from an empty text, which keeps its properties but empties its text.
    virtual IZELServerStatus* getJobResult(unsigned jobId, unsigned& found, IZELServerTransformationResult& result) = 0;
    // As getJobResult, as text; `resultText` is untouched when `found` is 0. On failure `found` is
    // untouched too.
    virtual IZELServerStatus* getJobResultString(unsigned jobId, unsigned& found, IZELServerString& resultText) = 0;

    // `exists` is the server's answer; untouched on failure.
    virtual IZELServerStatus* logFileExists(unsigned jobId, unsigned& exists) = 0;
    // Fills `info` with the log's description. `found` is set to 0 first and to 1 when the reply could
    // be read; an unreadable reply is no failure (null, `found` 0).
    virtual IZELServerStatus* getLogFileInfo(unsigned jobId, IZELServerLogFileInfo& info, unsigned& found) = 0;
    // Downloads the log into the local file `localPath` by the download rule of IZELServerRepository.h
    // (393638 names "job " and the ID): the file replaces `localPath` only when the server's final
    // answer is "true"; after "false" (`success` 0) or a failure an existing file is left as it was.
    virtual IZELServerStatus* getLogFile(unsigned jobId, const IZELServerString& localPath, unsigned& success) = 0;

    virtual ~IZELServerTransformationManager() = default;

    // Keeps its place behind the destructor; always returns 0.
    virtual unsigned reserved() const = 0;

protected:
    IZELServerTransformationManager() = default;
    IZELServerTransformationManager(const IZELServerTransformationManager&) = delete;
    IZELServerTransformationManager& operator=(const IZELServerTransformationManager&) = delete;
};
