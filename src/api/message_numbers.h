#pragma once
// Message numbers of the library's failures; their texts live in messages/zelserverapi.msg.

namespace zel::msg {

inline constexpr unsigned kConnectFailed = 393601;           // cannot connect to the server
inline constexpr unsigned kReplyWithoutBody = 393602;        // reply has no NUL or an empty body (param: reply)
inline constexpr unsigned kUnexpectedReply = 393604;         // unknown status word, or not a boolean
inline constexpr unsigned kSendFailed = 393607;              // send failed (param: socket code)
inline constexpr unsigned kReceiveFailed = 393608;           // receive failed (param: socket code)
inline constexpr unsigned kInvalidArgument = 393617;         // an argument is invalid (params vary)
inline constexpr unsigned kResultPortAcceptFailed = 393618;  // the server did not call back
inline constexpr unsigned kRequiredValueMissing = 393619;    // a required name or path is empty
inline constexpr unsigned kXmlFailure = 393620;              // XML platform or parse failure (param: text)
inline constexpr unsigned kUnreadableReply = 393621;         // reply is not the expected object
inline constexpr unsigned kNotConnected = 393622;            // no connection (close, or a command)
inline constexpr unsigned kLocalFileRead = 393623;           // a local file cannot be read (param: path)
inline constexpr unsigned kLocalFileWrite = 393624;          // a local file cannot be written (param: path)
inline constexpr unsigned kServerError = 393625;             // the server's error, or a bad argument (param: text)
inline constexpr unsigned kForbiddenCharacter = 393626;      // a name holds a forbidden character
inline constexpr unsigned kResourceNamedAsItem = 393627;     // a resource has the name of its item
inline constexpr unsigned kSerializeFailed = 393630;         // XML serialisation failed (param: text)
inline constexpr unsigned kSignInRefused = 393631;           // the handshake was not accepted
inline constexpr unsigned kRegistrationRefused = 393635;     // the service does not take this item type
inline constexpr unsigned kEmptyDownload = 393638;           // a downloaded item arrived empty (param: item)
inline constexpr unsigned kUnsupportedConnection = 393639;   // a web-address connection

}  // namespace zel::msg
