#include "security/ZELServerUserToken.h"

#include <utility>

#include "api/ZELServerString.h"
#include "transport/attribute_binding.h"
#include "transport/object_reader.h"
#include "transport/xml_document.h"

namespace zel {
namespace {

// A timeout the server wrote in some other form ("3600.5", "abc") is no reason to lose the token
// itself: it reads as 0 and the reading still succeeds.
constexpr AttributeBinding<UserTokenFields> kUserTokenAttributes[] = {
    {"token", &UserTokenFields::token},
    {"clientaddress", &UserTokenFields::clientAddress},
    {"expirationtimeout", &UserTokenFields::expirationTimeout},
    {"firsttokendate", &UserTokenFields::firstTokenDate},
    {"lasttokendate", &UserTokenFields::lastTokenDate},
    {"expirationdate", &UserTokenFields::expirationDate},
};

}  // namespace

ZELServerUserToken::ZELServerUserToken(std::string token, std::string clientAddress, long long expirationTimeout)
{
    fields_.token = std::move(token);
    fields_.clientAddress = std::move(clientAddress);
    fields_.expirationTimeout = expirationTimeout;
}

void ZELServerUserToken::getToken(IZELServerString& out) const { handOutText(fields_.token, out); }

void ZELServerUserToken::getClientAddress(IZELServerString& out) const { handOutText(fields_.clientAddress, out); }

bool ZELServerUserToken::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kUserTokenAttributes);
    return true;
}

// The token is a child of the document element: a document element that is itself "USERTOKEN", or
// a token deeper down, describes something else.
int readUserTokenReply(std::string_view body, IZELServerUserToken& token)
{
    return readReplyDocument(body, [&token](const XmlElement& root) {
        auto* concrete = dynamic_cast<ZELServerUserToken*>(&token);
        for (const XmlElement* child : childElements(&root)) {
            if (child->name() == "USERTOKEN") {
                return concrete != nullptr && concrete->readFrom(*child);
            }
        }
        return false;
    });
}

}  // namespace zel
