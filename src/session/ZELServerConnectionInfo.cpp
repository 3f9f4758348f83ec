#include "session/ZELServerConnectionInfo.h"

#include <charconv>
#include <cstdint>

#include "api/exception_guard.h"
#include "api/ZELServerString.h"

namespace zel {
namespace {

constexpr std::string_view kHttpScheme = "http://";
constexpr std::string_view kHttpsScheme = "https://";

// Single sign-on data wins over a token: a caller that hands both is signing in through the
// single sign-on service, and the token is only a leftover of an earlier sign-in.
unsigned authenticationKindOf(const StringDict& properties)
{
    if (properties.contains("SSO_AUTH_DATA")) {
        return kSingleSignOnAuthentication;
    }
    if (properties.contains("USER_TOKEN")) {
        return kTokenAuthentication;
    }
    return kPropertyAuthentication;
}

// A port as a user writes it in an address: decimal digits only, at most 32 bits of them. Callers
// rely on a too-large port wrapping to its low 16 bits rather than falling back to the default.
bool readPort(std::string_view text, unsigned short& port)
{
    std::uint32_t value = 0;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, value, 10);
    if (text.empty() || error != std::errc() || stop != end) {
        return false;
    }
    port = static_cast<unsigned short>(value & 0xFFFFu);
    return true;
}

}  // namespace

ServerAddress parseServerAddress(std::string_view address)
{
    ServerAddress parsed;
    const bool https = address.starts_with(kHttpsScheme);
    if (!https && !address.starts_with(kHttpScheme)) {
        parsed.host = std::string(address);
        return parsed;
    }
    const std::size_t start = https ? kHttpsScheme.size() : kHttpScheme.size();
    const std::size_t colon = address.find(':', start);
    if (colon == std::string_view::npos) {
        parsed.port = https ? kDefaultHttpsPort : kDefaultHttpPort;
        const std::size_t slash = address.find('/', start);
        parsed.host = std::string(address.substr(start, slash == std::string_view::npos ? slash : slash - start));
        return parsed;
    }
    parsed.host = std::string(address.substr(start, colon - start));
    const std::size_t slash = address.find('/', colon + 1);
    const std::string_view portText =
        address.substr(colon + 1, slash == std::string_view::npos ? slash : slash - colon - 1);
    readPort(portText, parsed.port);
    return parsed;
}

ZELServerConnectionInfo::ZELServerConnectionInfo(const IZELServerString& address,
                                                 const IZELServerStringArray& properties)
    : properties_(properties)
{
    takeAddress(address);
    authenticationKind_ = authenticationKindOf(properties_);
}

ZELServerConnectionInfo::ZELServerConnectionInfo(const IZELServerString& address, const IZELServerString& userName,
                                                 const IZELServerString& password)
    : userName_(toStdString(userName)), password_(toStdString(password))
{
    takeAddress(address);
}

ZELServerConnectionInfo::ZELServerConnectionInfo(const IZELServerString& host, unsigned short port,
                                                 const IZELServerStringArray& properties)
    : host_(toStdString(host)), port_(port), properties_(properties)
{
    authenticationKind_ = authenticationKindOf(properties_);
}

ZELServerConnectionInfo::ZELServerConnectionInfo(const IZELServerString& host, unsigned short port,
                                                 const IZELServerString& userName, const IZELServerString& password)
    : host_(toStdString(host)), port_(port), userName_(toStdString(userName)), password_(toStdString(password))
{}

void ZELServerConnectionInfo::takeAddress(const IZELServerString& address)
{
    address_ = toStdString(address);
    connectionKind_ = kWebAddressConnection;
    ServerAddress parsed = parseServerAddress(address_);
    host_ = std::move(parsed.host);
    port_ = parsed.port;
}

void ZELServerConnectionInfo::getHost(IZELServerString& out) const { handOutText(host_, out); }
void ZELServerConnectionInfo::getUserName(IZELServerString& out) const { handOutText(userName_, out); }
void ZELServerConnectionInfo::getPassword(IZELServerString& out) const { handOutText(password_, out); }
void ZELServerConnectionInfo::getAddress(IZELServerString& out) const { handOutText(address_, out); }
void ZELServerConnectionInfo::getAuxiliaryText(IZELServerString& out) const { handOutText(auxiliaryText_, out); }

bool ZELServerConnectionInfo::getProperty(const IZELServerString& key, IZELServerString& out) const
{
    return guarded([&]() -> bool {
        // The key is taken as far as its first NUL, like every key the session's callers pass.
        const char* keyText = key.c_str();
        const std::string* value = properties_.find(keyText != nullptr ? keyText : "");
        if (value == nullptr) {
            return false;
        }
        copyText(*value, out);
        return true;
    });
}

}  // namespace zel
