#pragma once
// One server command written as what it is: its keyword, its argument checks, its named values in
// wire order, and how its reply is read. Every manager and every object that talks to the server
// sends its commands through this class.
//
//     return CheckedCommand(channel_, "SR_EXISTS")
//         .add("srName", name_).addPath("srPath", path)
//         .askFlag(present);
//
// Checks run in the order written, as they are written, and the first one that fails decides the
// status; values are only collected. The final call then either returns that status (having made
// nothing and sent nothing), or 393622 when there is no channel (an object made before the session
// connected), or makes the request through zel::Command, adds the values, runs the exchange, reads
// the reply and releases request and response on every path.
//
// Out flags. A final call that is given an out flag (askFlag, askObject, download, run with a flag)
// sets it to 0 before anything else, so after any failure, and after a reply that does not answer
// the question, it reads 0: a caller can never mistake an old value for the server's answer. An
// operation whose contract promises that the caller's value survives a failed or unanswered command
// passes OnFailure::kKeep and says so where it does.
//
// Objects handed to add... by reference are borrowed until the final call returns.

#include <functional>
#include <string>
#include <vector>

#include <zelserverapi/IZELServerPath.h>
#include <zelserverapi/IZELServerProgressListener.h>
#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerStatus.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>
#include <zelserverapi/IZELServerUserToken.h>

#include "api/status.h"
#include "transport/IZELServerChannel.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"
#include "transport/command.h"

namespace zel {

// One argument check: holds, or names the message (and its parameters) the command fails with.
// `where` is the line that wrote the check, which the failure's status records.
struct Check {
    bool holds = true;
    unsigned number = 0;
    std::vector<std::string> parameters;
    Where where = Where::current();
};

// What a failed or unanswered command leaves in an out flag (see the header comment).
enum class OnFailure { kClear, kKeep };

class CheckedCommand {
public:
    // Reads the reply into the caller's objects: 0, or a message number.
    using Reader = std::function<int(const IZELServerResponse&)>;
    // Runs the exchange on a ready command; returns its status (null for success).
    using Exchange = std::function<IZELServerStatus*(Command&)>;

    // `channel` is borrowed and may be null (see the header comment). Statuses the command makes
    // itself (no channel, a path it cannot write) record `where`, the line that wrote the command.
    CheckedCommand(IZELServerChannel* channel, std::string keyword, Where where = Where::current());

    // ---- Checks ----
    CheckedCommand& check(const Check& check);
    // Message `number` with `parameters` when `condition` is false.
    CheckedCommand& check(bool condition, unsigned number, std::vector<std::string> parameters = {},
                          Where where = Where::current());
    // 393619 when the text is empty.
    CheckedCommand& require(const IZELServerString& text, Where where = Where::current());
    // 393619 when `condition` is false (unusable directives).
    CheckedCommand& require(bool condition, Where where = Where::current());

    // ---- Values, in wire order ----
    CheckedCommand& add(const std::string& name, const std::string& value);
    CheckedCommand& add(const std::string& name, const IZELServerString& value);
    // Each pair of the flat list as its own value (the list's name is not written).
    CheckedCommand& addList(const std::string& name, const IZELServerStringArray& pairs);
    // The pair lists the result-port exchange writes itself, behind the port and host it adds.
    CheckedCommand& appendDirectives(const IZELServerStringArray& pairs);
    CheckedCommand& appendNotifications(const IZELServerStringArray& pairs);
    // A document with root `rootName` that `object` writes into. A document that cannot be built is
    // left out: the server then refuses the command and says why, which tells the caller more than a
    // local XML failure would. The same holds for the service, repository and token documents.
    CheckedCommand& addXml(const std::string& name, const XmlWritable& object, const std::string& rootName);
    CheckedCommand& addService(const std::string& name, const IZELServerService& service);
    CheckedCommand& addRepository(const std::string& name, const IZELServerString& repositoryName,
                                  const IZELServerString& description);
    CheckedCommand& addUserToken(const std::string& name, const IZELServerUserToken& token);
    // A "PATH" document. A path that cannot be written (a NUL in it) would reach the server as a
    // command without its path, so it fails the command instead (its message number, parameter:
    // `name`) with nothing sent.
    CheckedCommand& addPath(const std::string& name, const IZELServerPath& path);

    // ---- Final calls ----
    // Status only; `requestType` as IZELServerChannel::sendRequest takes it.
    IZELServerStatus* send(unsigned requestType = kPlainRequest);
    // The reply's truth value into `flag`; a reply that is none leaves the flag as the policy says
    // and still succeeds.
    IZELServerStatus* askFlag(unsigned& flag, OnFailure onFailure = OnFailure::kClear);
    // One object: `found` becomes 1 when `read` returns 0, else 0; the command still succeeds.
    IZELServerStatus* askObject(unsigned& found, const Reader& read, OnFailure onFailure = OnFailure::kClear);
    // A list: `read` fills the caller's vector; what it returns does not change the status.
    IZELServerStatus* askList(const Reader& read);
    // A reply the command cannot do without: a failed `read` is the command's failure (its number).
    IZELServerStatus* askParsed(const Reader& read);
    // The reply body, whole, into `text` (untouched on failure).
    IZELServerStatus* askText(IZELServerString& text);
    // Sends the local file `path` with the command. 393623 with the path, nothing sent, when it
    // cannot be opened.
    IZELServerStatus* upload(const IZELServerString& path, IZELServerProgressListener* progress);
    // Receives the command's file for `target` (see Command::receive, the one download rule);
    // `received` is 1 when the file replaced the destination.
    IZELServerStatus* download(const DownloadTarget& target, unsigned& received, IZELServerProgressListener* progress);
    // The checks, then `exchange` on the ready command (for exchanges that need more than one step).
    IZELServerStatus* run(const Exchange& exchange);
    // As run, for an exchange that answers through `flag`, which the policy governs.
    IZELServerStatus* run(unsigned& flag, const Exchange& exchange, OnFailure onFailure = OnFailure::kClear);

private:
    // Adds one value to a ready command; a status refuses the command before it is sent.
    using Value = std::function<IZELServerStatus*(Command&)>;

    CheckedCommand& addValue(Value value);

    IZELServerChannel* channel_;
    std::string keyword_;
    Where where_;
    std::vector<Value> values_;
    Check failure_;
};

}  // namespace zel
