#pragma once
// Fields that a request payload carries but that the public interfaces of their objects do not
// give out. The library's own object classes implement these next to their public interface; the
// request finds them with a cross cast. An object without them (a caller's own implementation of
// the public interface) is written with the field's value for an object that never came from the
// server.

#include <string>

namespace zel {

// Implemented by the library's service class: the "service_id" the server gave the service ("-1"
// for a service made on this side and not yet read back).
class ServicePayloadFields {
public:
    virtual ~ServicePayloadFields() = default;
    virtual std::string serviceId() const = 0;
};

// Implemented by the library's user-token class: the server's date texts, sent back unchanged
// (empty for a token made on this side).
class UserTokenPayloadFields {
public:
    virtual ~UserTokenPayloadFields() = default;
    virtual std::string firstTokenDate() const = 0;
    virtual std::string lastTokenDate() const = 0;
    virtual std::string expirationDate() const = 0;
};

}  // namespace zel
