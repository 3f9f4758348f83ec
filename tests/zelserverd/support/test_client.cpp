#include "test_client.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>

namespace zeltest {

std::string requestPayload(const std::string& keyword, const Values& values) {
  std::string payload = "APIVERSION=1";
  payload.push_back('\0');
  payload += keyword;
  payload.push_back('\0');
  payload += "clientID=";
  for (const auto& [name, value] : values) {
    payload.push_back('\0');
    payload += name + "=" + value;
  }
  return payload;
}

std::string frame(const std::string& payload) {
  std::uint32_t n = static_cast<std::uint32_t>(payload.size());
  std::string out;
  out.push_back(static_cast<char>(n >> 24));
  out.push_back(static_cast<char>(n >> 16));
  out.push_back(static_cast<char>(n >> 8));
  out.push_back(static_cast<char>(n));
  return out + payload;
}

WireReply splitReply(const std::string& payload) {
  std::size_t nul = payload.find('\0');
  if (nul == std::string::npos) return {payload, {}};
  return {payload.substr(0, nul), payload.substr(nul + 1)};
}

std::uint32_t crc32(const std::string& data) {
  std::uint32_t c = 0xFFFFFFFFu;
  for (unsigned char byte : data) {
    c ^= byte;
    for (int k = 0; k < 8; ++k) c = (c & 1) ? 0xEDB88320u ^ (c >> 1) : c >> 1;
  }
  return ~c;
}

std::string pathDocument(const std::string& path) {
  std::size_t slash = path.rfind('/');
  std::string name = slash == std::string::npos ? path : path.substr(slash + 1);
  std::string dir = slash == std::string::npos ? std::string() : path.substr(0, slash);
  return "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?><SR_PATH><PATH name=\"" +
         name + "\" dirpath=\"" + dir + "\" abspath=\"" + path + "\"/></SR_PATH>";
}

TestClient::~TestClient() { close(); }

bool TestClient::connect(std::uint16_t port) {
  close();
  fd_ = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_in addr{};
  addr.sin_family = AF_INET;
  addr.sin_port = htons(port);
  addr.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  return fd_ >= 0 && ::connect(fd_, reinterpret_cast<sockaddr*>(&addr), sizeof addr) == 0;
}

void TestClient::close() {
  if (fd_ >= 0) ::close(fd_);
  fd_ = -1;
}

bool TestClient::sendRaw(const std::string& bytes) {
  std::size_t sent = 0;
  while (sent < bytes.size()) {
    ssize_t n = ::send(fd_, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) return false;
    sent += static_cast<std::size_t>(n);
  }
  return true;
}

bool TestClient::waitReadable(int timeoutMs) {
  pollfd p{fd_, POLLIN, 0};
  return ::poll(&p, 1, timeoutMs) == 1;
}

bool TestClient::recvExact(char* data, std::size_t size, int timeoutMs) {
  while (size > 0) {
    if (!waitReadable(timeoutMs)) return false;
    ssize_t n = ::recv(fd_, data, size, 0);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) return false;
    data += n;
    size -= static_cast<std::size_t>(n);
  }
  return true;
}

std::optional<std::string> TestClient::readFrame(int timeoutMs) {
  unsigned char prefix[4];
  if (fd_ < 0 || !recvExact(reinterpret_cast<char*>(prefix), 4, timeoutMs)) return std::nullopt;
  std::uint32_t n = (std::uint32_t{prefix[0]} << 24) | (std::uint32_t{prefix[1]} << 16) |
                    (std::uint32_t{prefix[2]} << 8) | prefix[3];
  if (n > (64u << 20)) return std::nullopt;
  std::string payload(n, '\0');
  if (n > 0 && !recvExact(payload.data(), n, timeoutMs)) return std::nullopt;
  return payload;
}

bool TestClient::closedByPeer(int timeoutMs) {
  if (!waitReadable(timeoutMs)) return false;
  // A server that closes with request bytes still unread makes the kernel reset the
  // connection instead of ending it; both mean the server closed it.
  char byte;
  ssize_t n = ::recv(fd_, &byte, 1, 0);
  return n == 0 || (n < 0 && errno == ECONNRESET);
}

WireReply TestClient::command(const std::string& keyword, const Values& values) {
  if (!sendFrame(requestPayload(keyword, values))) return {};
  std::optional<std::string> reply = readFrame();
  return reply ? splitReply(*reply) : WireReply{};
}

WireReply TestClient::signIn(const std::string& user, const std::string& password) {
  return command("SERVER_SESSION_INIT", {{"userID", user}, {"userPassword", password}});
}

WireReply TestClient::upload(const std::string& keyword, const Values& values,
                             const std::string& content,
                             std::optional<std::uint32_t> announcedCrc) {
  if (!sendFrame(requestPayload(keyword, values))) return {};
  std::optional<std::string> ack = readFrame();
  if (!ack) return {};
  WireReply first = splitReply(*ack);
  if (!(first.ok() && first.body == "ready_to_transfer")) return first;
  std::string header = "fileLength=" + std::to_string(content.size());
  header.push_back('\0');
  header += "fileCRC=" + std::to_string(announcedCrc.value_or(crc32(content)));
  if (!sendFrame(header)) return {};
  ack = readFrame();
  if (!ack) return {};
  WireReply second = splitReply(*ack);
  if (!(second.ok() && second.body == "ready_to_transfer")) return second;
  if (!sendRaw(content)) return {};
  std::optional<std::string> reply = readFrame();
  return reply ? splitReply(*reply) : WireReply{};
}

Download TestClient::download(const std::string& keyword, const Values& values) {
  Download result;
  if (!sendFrame(requestPayload(keyword, values))) return result;
  std::optional<std::string> header = readFrame();
  if (!header) return result;
  WireReply parts = splitReply(*header);
  if (parts.status.rfind("fileLength=", 0) != 0 || parts.body.rfind("fileCRC=", 0) != 0) {
    result.reply = parts;
    return result;
  }
  std::size_t length = std::stoul(parts.status.substr(11));
  std::string ack = "SUCCESS";
  ack.push_back('\0');
  ack += "ready_to_transfer";
  if (!sendFrame(ack)) return result;
  result.content.assign(length, '\0');
  if (length > 0 && !recvExact(result.content.data(), length, 5000)) return result;
  result.gotFile = crc32(result.content) == std::stoul(parts.body.substr(8));
  if (!sendFrame(ack)) return result;
  std::optional<std::string> reply = readFrame();
  if (reply) result.reply = splitReply(*reply);
  return result;
}

}  // namespace zeltest
