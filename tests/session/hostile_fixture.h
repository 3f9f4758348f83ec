#pragma once
// A session, made through the exported entry point, signed in as "ann" to the scriptable fake server
// with connection properties of the test's choosing: the way a client that sets limits connects.

#include <cstdint>
#include <map>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/fake_server.h"

namespace zeltest {

using Properties = std::map<std::string, std::string>;

// A password sign-in with extra properties: the public interface implemented by the client itself.
class PropertyConnection final : public IZELServerConnectionInfo {
public:
    PropertyConnection(std::uint16_t port, Properties properties) : port_(port), properties_(std::move(properties)) {}

    void getHost(IZELServerString& out) const override { out.assign("127.0.0.1"); }
    unsigned short getPort() const override { return port_; }
    void getUserName(IZELServerString& out) const override { out.assign("ann"); }
    void getPassword(IZELServerString& out) const override { out.assign("pw1"); }
    unsigned getConnectionKind() const override { return 0; }
    void getAddress(IZELServerString& out) const override { out.assign(""); }
    void getAuxiliaryText(IZELServerString& out) const override { out.assign(""); }
    unsigned getAuthenticationKind() const override { return 0; }
    bool getProperty(const IZELServerString& key, IZELServerString& out) const override
    {
        const auto found = properties_.find(key.c_str());
        if (found == properties_.end()) {
            return false;
        }
        out.assign(found->second.c_str());
        return true;
    }

private:
    std::uint16_t port_;
    Properties properties_;
};

inline Bytes firstHandshake()
{
    return request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}});
}

inline Bytes signedIn()
{
    return reply("SUCCESS", R"(<S><IDENTITY id="ann" is_authenticated="true"><ROLES/></IDENTITY></S>)");
}

// Message number and code of a status, which is released; {0, 0} for success.
struct Outcome {
    unsigned number = 0;
    unsigned code = 0;
    std::string message;
};

class HostileSessionTest : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_NE(ZEL_createServerSession(&session), nullptr); }
    void TearDown() override { ZEL_destroyServerSession(&session); }

    Outcome outcome(IZELServerStatus* status)
    {
        Outcome result;
        if (status != nullptr) {
            result = {status->getMessageNumber(), status->getCode(), status->getMessage()};
        }
        session->destroyStatus(&status);
        return result;
    }

    Outcome init(std::uint16_t port, const Properties& properties = {})
    {
        const PropertyConnection info(port, properties);
        return outcome(session->init(info, nullptr));
    }

    // Scripts the sign-in, runs the script and signs in.
    void signIn(FakeServer& server, const Properties& properties = {})
    {
        server.start();
        const Outcome signed_ = init(server.port(), properties);
        ASSERT_EQ(signed_.number, 0u) << signed_.message;
    }

    Outcome sessionProperty(std::string* value = nullptr)
    {
        IZELServerString* name = session->createString();
        IZELServerString* out = session->createString();
        name->assign("BUILD");
        const Outcome result = outcome(session->getSessionProperty(*name, *out));
        if (value != nullptr) {
            *value = out->c_str();
        }
        session->destroyString(&name);
        session->destroyString(&out);
        return result;
    }

    IZELServerSession* session = nullptr;
};

}  // namespace zeltest
