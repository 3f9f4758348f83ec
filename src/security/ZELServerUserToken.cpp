#include "security/ZELServerUserToken.h"

#include <utility>

#include "api/conversions.h"
#include "transport/object_reader.h"
#include "transport/xml_element.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

void copyOut(const std::string& text, IZELServerString& out)
{
    out.set(text.data(), static_cast<unsigned>(text.size()));
}

}  // namespace

ZELServerUserToken::ZELServerUserToken(std::string token, std::string clientAddress, long long expirationTimeout)
    : token_(std::move(token)), clientAddress_(std::move(clientAddress)), expirationTimeout_(expirationTimeout)
{}

void ZELServerUserToken::getToken(IZELServerString& out) const { copyOut(token_, out); }

void ZELServerUserToken::getClientAddress(IZELServerString& out) const { copyOut(clientAddress_, out); }

bool ZELServerUserToken::readFrom(const XmlElement& element)
{
    getAttribute(&element, "token", token_);
    getAttribute(&element, "clientaddress", clientAddress_);
    std::string timeout;
    getAttribute(&element, "expirationtimeout", timeout);
    // A timeout the server wrote in some other form ("3600.5", "abc") is no reason to lose the
    // token itself: the reading still succeeds and the timeout is 0.
    expirationTimeout_ = toInt64(timeout).value_or(0);
    getAttribute(&element, "firsttokendate", firstTokenDate_);
    getAttribute(&element, "lasttokendate", lastTokenDate_);
    getAttribute(&element, "expirationdate", expirationDate_);
    return true;
}

int readUserTokenReply(std::string_view body, IZELServerUserToken& token)
{
    return readFirstObject<ZELServerUserToken>(
        body, "USERTOKEN", token,
        [](ZELServerUserToken& target, const XmlElement& element) { return target.readFrom(element); });
}

}  // namespace zel
