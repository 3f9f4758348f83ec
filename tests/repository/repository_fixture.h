#pragma once
// The repository wire tests run on the shared signed-in channel (tests/support); this adds what only
// they need: the plain "SUCCESS" answer, status numbers, file transfers and a scratch folder.

#include <filesystem>
#include <fstream>
#include <string>

#include "api/ZELServerString.h"
#include "support/environment.h"
#include "support/signed_in_channel.h"

namespace zel::repotest {

using zeltest::Bytes;
using zeltest::describe;
using zeltest::slurp;
using zeltest::StatusPtr;

inline ZELServerString S(const std::string& text) { return ZELServerString(text); }
inline Bytes success(const std::string& body) { return zeltest::reply("SUCCESS", body); }
inline unsigned numberOf(const StatusPtr& status) { return status ? status->getMessageNumber() : 0; }

class RepositoryWireTest : public zeltest::SignedInChannelTest {
protected:
    // The client's side of an upload: the command, the server's go-ahead, the file header, the go-ahead
    // again, the raw content, then the final answer.
    void expectUpload(const Bytes& commandBytes, const std::string& content)
    {
        server.exchange(commandBytes, zeltest::readyAck())
            .exchange(zeltest::fileHeader(content.size(), zeltest::crc32(content)), zeltest::readyAck())
            .expectRawBytes(content)
            .sendFrame(success("true"));
    }

    // The server's side of a download: the file header, the client's go-ahead, the content, a second
    // go-ahead, then `answer`.
    void expectDownload(const Bytes& commandBytes, const std::string& content, const Bytes& answer)
    {
        server.exchange(commandBytes, zeltest::fileHeader(content.size(), zeltest::crc32(content)))
            .expectFrame(zeltest::readyAck());
        if (!content.empty()) {
            server.sendRaw(content);
        }
        server.exchange(zeltest::readyAck(), answer);
    }

    std::string file(const std::string& name, const std::string& content) const
    {
        const std::filesystem::path path = dir / name;
        std::ofstream(path, std::ios::binary) << content;
        return path.string();
    }

    const zeltest::TempDir scratch{"zel-repo"};
    const std::filesystem::path& dir = scratch.path();
};

}  // namespace zel::repotest
