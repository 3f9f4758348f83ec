#pragma once
// One repository command written as what it is: its keyword, its argument checks, its named values
// in wire order, and how its reply is read.
//
//     return CheckedCommand(channel_, "REP_ITEMEXISTS")
//         .require(itemName).allowedName(itemName)
//         .add("repositoryName", name_).add("itemName", itemName)
//         .askFlag(exists);
//
// Checks run in the order written, as they are written, and the first one that fails decides the
// status; values are only collected. The final call then either returns that status (having made
// nothing and sent nothing) or makes the request through zel::Command, adds the values, runs the
// exchange, reads the reply and releases request and response on every path. Out flags given to the
// final call are set to 0 before anything else, so they read 0 after any failure.
//
// Objects handed to add... by reference are borrowed until the final call returns.

#include <functional>
#include <string>
#include <vector>

#include <zelserverapi/IZELServerProgressListener.h>
#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerStatus.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/ZELServerStringDict.h>

#include "api/ZELServerStringArray.h"
#include "transport/IZELServerChannel.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"
#include "transport/command.h"

namespace zel {

// The characters no repository, item or resource name may hold, as the status names them.
inline constexpr const char* kForbiddenNameCharacters = "\\/:*?\"<>|&='+%";

// True when the name holds none of kForbiddenNameCharacters.
bool isAllowedName(const IZELServerString& name);

// The "enableFilter" value the server knows for the caller's "ENABLE_FILTER" directive ("ALL",
// "ENABLED", "DISABLED", compared exactly, give "All", "Enabled", "Disabled"); empty for any other
// value and for a missing key.
std::string enableFilterFor(const ZELServerStringDict& directives);

// The directive list of the filtered lists: "enableFilter" followed by "All" without directives, or
// by the value for the caller's "ENABLE_FILTER". A missing or unknown filter leaves the list with its
// one entry, which the caller refuses (393619).
ZELServerStringArray enableFilterList(const ZELServerStringDict* directives);

class CheckedCommand {
public:
    using Reader = std::function<int(const IZELServerResponse&)>;
    // Runs the exchange on a ready command; returns its status (null for success).
    using Exchange = std::function<IZELServerStatus*(Command&)>;

    // `channel` is borrowed; a null channel (an object made before the session connected) fails the
    // final call with 393622 once the arguments have passed their checks.
    CheckedCommand(IZELServerChannel* channel, std::string keyword);

    // ---- Checks ----
    // 393619 when the text is empty.
    CheckedCommand& require(const IZELServerString& text);
    // 393619 when `condition` is false (unusable directives).
    CheckedCommand& require(bool condition);
    // 393626 (parameter: the forbidden characters) when the name holds one of them.
    CheckedCommand& allowedName(const IZELServerString& name);
    // 393627 when a resource has exactly the name of its item.
    CheckedCommand& distinct(const IZELServerString& resourceName, const IZELServerString& itemName);
    // Message `number` when `condition` is false.
    CheckedCommand& check(bool condition, unsigned number);

    // ---- Values, in wire order ----
    CheckedCommand& add(const std::string& name, const std::string& value);
    CheckedCommand& add(const std::string& name, const IZELServerString& value);
    // Each pair of the flat list as its own value (the list's name is not written).
    CheckedCommand& addList(const std::string& name, const ZELServerStringArray& pairs);
    // A document with root `rootName` that `object` writes into. A document that cannot be built
    // is left out: the server then refuses the command and says why.
    CheckedCommand& addXml(const std::string& name, const XmlWritable& object, const std::string& rootName);
    CheckedCommand& addService(const std::string& name, const IZELServerService& service);
    CheckedCommand& addRepository(const std::string& name, const IZELServerString& repositoryName,
                                  const IZELServerString& description);

    // ---- Final calls ----
    // Status only.
    IZELServerStatus* send();
    // The reply's "true" / "false" into `flag`; another reply leaves it 0 and still succeeds.
    IZELServerStatus* askFlag(unsigned& flag);
    // One object: `found` becomes 1 when `read` returns 0.
    IZELServerStatus* askObject(unsigned& found, const Reader& read);
    // A list: `read` fills the caller's vector; what it returns does not change the status.
    IZELServerStatus* askList(const Reader& read);
    // Sends the local file `path` with the command. 393623 with the path, nothing sent, when it
    // cannot be opened.
    IZELServerStatus* upload(const IZELServerString& path, IZELServerProgressListener* progress);
    // The checks, then `exchange` on the ready command (for transfers that need more than one step).
    IZELServerStatus* run(const Exchange& exchange);

private:
    using Value = std::function<void(Command&)>;

    CheckedCommand& fail(unsigned number, std::string parameter = {});

    IZELServerChannel* channel_;
    std::string keyword_;
    std::vector<Value> values_;
    unsigned failure_ = 0;
    std::string failureParameter_;
};

}  // namespace zel
