#pragma once
// A session, made through the exported entry point, signed in as "ann" to the scriptable fake server
// with connection properties of the test's choosing: the way a client that sets limits connects.
// Also the library's calls of each exchange kind, for the tables that cut or lie to them.

#include <cstdint>
#include <functional>
#include <map>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <zelserverapi/ZELServerOwned.h>
#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/fake_server.h"
#include "support/helpers.h"

namespace zeltest {

using Properties = std::map<std::string, std::string>;

// A password sign-in with extra properties: the public interface implemented by the client itself.
// A property "!throw" makes every lookup fail the way client code can: "memory" runs out of memory,
// any other value is thrown as the text of an error.
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
        if (const auto thrown = properties_.find("!throw"); thrown != properties_.end()) {
            thrown->second == "memory" ? throw std::bad_alloc() : throw std::runtime_error(thrown->second);
        }
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

// Strings made for one call and released after it.
class Texts {
public:
    explicit Texts(IZELServerSession& session) : session_(session) {}
    IZELServerString& operator()(const std::string& value)
    {
        made_.emplace_back(zelServerOwn(session_, session_.createString()));
        made_.back()->set(value.data(), static_cast<unsigned>(value.size()));
        return *made_.back();
    }

private:
    IZELServerSession& session_;
    std::vector<ZELServerOwned<IZELServerString>> made_;
};

// One call of the library on a signed-in session; `file` is the local file it reads or writes.
using Call = std::function<IZELServerStatus*(IZELServerSession&, const std::string& file, unsigned& received)>;

inline IZELServerStatus* getItem(IZELServerSession& s, const std::string& file, unsigned& received)
{
    Texts t(s);
    return zelServerOwn(s, s.createRepository())->getItem(t("plan.zlw"), t(file), received);
}

inline IZELServerStatus* getItemResource(IZELServerSession& s, const std::string& file, unsigned& received)
{
    Texts t(s);
    return zelServerOwn(s, s.createRepository())->getItemResource(t("plan.zlw"), t("notes.txt"), t(file), received);
}

inline IZELServerStatus* getLogFile(IZELServerSession& s, const std::string& file, unsigned& received)
{
    Texts t(s);
    return s.getTransformationManager()->getLogFile(42, t(file), received);
}

inline IZELServerStatus* downloadSharedFile(IZELServerSession& s, const std::string& file, unsigned& received)
{
    Texts t(s);
    const auto area = zelServerOwn(s, s.createMountPoint());
    IZELServerPath* path = area->createPath(t("/in/a.txt"));
    IZELServerStatus* status = area->download(*path, t(file), received, nullptr);
    area->releaseObject(path);
    return status;
}

inline IZELServerStatus* transactJob(IZELServerSession& s, const std::string&, unsigned&)
{
    Texts t(s);
    const auto directives = zelServerOwn(s, s.createStringArray());
    return s.getTransformationManager()->transactJobString(t("svc"), t("job"), *directives, t(""));
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

    // Runs the script and signs in.
    void signIn(FakeServer& server, const Properties& properties = {})
    {
        server.start();
        const Outcome signed_ = init(server.port(), properties);
        ASSERT_EQ(signed_.number, 0u) << signed_.message;
    }

    // The session property "BUILD" into `value`, which keeps what it held when the call fails.
    Outcome sessionProperty(std::string* value = nullptr)
    {
        std::string unused;
        std::string& out = value != nullptr ? *value : unused;
        Texts t(*session);
        IZELServerString& text = t(out);
        const Outcome result = outcome(session->getSessionProperty(t("BUILD"), text));
        out.assign(text.data(), text.length());
        return result;
    }

    IZELServerSession* session = nullptr;
};

}  // namespace zeltest
