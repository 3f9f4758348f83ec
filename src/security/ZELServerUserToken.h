#pragma once
// The user token record ("USERTOKEN"). The three dates are the server's text: read from a reply and
// sent back unchanged, never interpreted, and reachable only by the request's payload writer.

#include <cstdint>
#include <string>
#include <string_view>

#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerUserToken.h>

#include "api/heap.h"
#include "transport/payload_fields.h"

namespace zel {

class XmlElement;

struct UserTokenFields {
    std::string token;
    std::string clientAddress;
    std::int64_t expirationTimeout = 0;
    std::string firstTokenDate;
    std::string lastTokenDate;
    std::string expirationDate;
};

class ZELServerUserToken final : public IZELServerUserToken, public UserTokenPayloadFields, public HeapObject {
public:
    // Empty texts and timeout 0.
    ZELServerUserToken() = default;
    // The dates stay empty: a token made on this side has not been stored yet.
    ZELServerUserToken(std::string token, std::string clientAddress, long long expirationTimeout);
    ~ZELServerUserToken() override = default;
    ZELServerUserToken(const ZELServerUserToken&) = delete;
    ZELServerUserToken& operator=(const ZELServerUserToken&) = delete;

    void getToken(IZELServerString& out) const override;
    void getClientAddress(IZELServerString& out) const override;
    long long getExpirationTimeout() const override { return fields_.expirationTimeout; }

    std::string firstTokenDate() const override { return fields_.firstTokenDate; }
    std::string lastTokenDate() const override { return fields_.lastTokenDate; }
    std::string expirationDate() const override { return fields_.expirationDate; }

    // Replaces every field from a "USERTOKEN" element: an absent attribute reads as the empty text,
    // and an "expirationtimeout" that is not a whole number (or does not fit) reads as 0. Never
    // refuses the element; returns true so that it can serve as the response's fill function.
    bool readFrom(const XmlElement& element);

private:
    UserTokenFields fields_;
};

// The response's token reader over a reply body (object_reader.h): fills `token` from the first
// "USERTOKEN" element. 0; the parser's message number when the body is not XML; 393621, with `token`
// untouched, when there is no such element or `token` is not the library's own.
int readUserTokenReply(std::string_view body, IZELServerUserToken& token);

}  // namespace zel
