#pragma once
// The connection information a session is initialised with: where the server is, how to sign in,
// and the extra connection properties. Read-only once made.

#include <string>
#include <string_view>

#include <zelserverapi/IZELServerConnectionInfo.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>

#include "api/StringDict.h"
#include "api/heap.h"

namespace zel {

// Connection kinds.
inline constexpr unsigned kHostAndPortConnection = 0;
inline constexpr unsigned kWebAddressConnection = 1;

// Authentication kinds.
inline constexpr unsigned kPasswordAuthentication = 0;
inline constexpr unsigned kTokenAuthentication = 1;
inline constexpr unsigned kSingleSignOnAuthentication = 2;
inline constexpr unsigned kPropertyAuthentication = 3;

// The port every web address starts from, and the one a bad explicit port falls back to.
inline constexpr unsigned short kDefaultHttpPort = 80;
inline constexpr unsigned short kDefaultHttpsPort = 443;

struct ServerAddress {
    std::string host;
    unsigned short port = kDefaultHttpPort;
};

// Host and port of a web address. Only a lower-case "http://" or "https://" at the very start is a
// scheme; anything else is taken whole as the host with port 80. The first ":" behind the scheme
// ends the host even when it stands inside the path ("http://h/p:1" is host "h/p", port 1). A port
// text that is not an unsigned decimal number leaves port 80, also for "https://".
ServerAddress parseServerAddress(std::string_view address);

class ZELServerConnectionInfo final : public IZELServerConnectionInfo, public HeapObject {
public:
    // Web address with properties: connection kind 1, authentication kind from the properties.
    ZELServerConnectionInfo(const IZELServerString& address, const IZELServerStringArray& properties);
    // Web address with user name and password: connection kind 1, authentication kind 0.
    ZELServerConnectionInfo(const IZELServerString& address, const IZELServerString& userName,
                            const IZELServerString& password);
    // Host and port with properties: connection kind 0, authentication kind from the properties.
    ZELServerConnectionInfo(const IZELServerString& host, unsigned short port, const IZELServerStringArray& properties);
    // Host and port with user name and password: connection kind 0, authentication kind 0.
    ZELServerConnectionInfo(const IZELServerString& host, unsigned short port, const IZELServerString& userName,
                            const IZELServerString& password);
    ~ZELServerConnectionInfo() override = default;

    ZELServerConnectionInfo(const ZELServerConnectionInfo&) = delete;
    ZELServerConnectionInfo& operator=(const ZELServerConnectionInfo&) = delete;

    void getHost(IZELServerString& out) const override;
    unsigned short getPort() const override { return port_; }
    void getUserName(IZELServerString& out) const override;
    void getPassword(IZELServerString& out) const override;
    unsigned getConnectionKind() const override { return connectionKind_; }
    void getAddress(IZELServerString& out) const override;
    void getAuxiliaryText(IZELServerString& out) const override;
    unsigned getAuthenticationKind() const override { return authenticationKind_; }
    bool getProperty(const IZELServerString& key, IZELServerString& out) const override;

private:
    void takeAddress(const IZELServerString& address);

    std::string host_;
    unsigned short port_ = kDefaultHttpPort;
    std::string userName_;
    std::string password_;
    unsigned connectionKind_ = kHostAndPortConnection;
    std::string address_;
    unsigned authenticationKind_ = kPasswordAuthentication;
    std::string auxiliaryText_;
    StringDict properties_;
};

}  // namespace zel
