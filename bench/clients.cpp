#include "clients.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstdio>
#include <memory>
#include <stdexcept>

#include <xercesc/dom/DOM.hpp>
#include <xercesc/framework/MemBufInputSource.hpp>
#include <xercesc/parsers/XercesDOMParser.hpp>
#include <xercesc/util/PlatformUtils.hpp>
#include <xercesc/util/TransService.hpp>
#include <zlib.h>

#include "wire.h"

namespace bench {
namespace {

using xercesc::DOMElement;

void require(bool condition, const std::string& what)
{
    if (!condition) {
        throw std::runtime_error(what);
    }
}

std::string bodyOf(const std::string& reply, const char* what)
{
    const std::size_t nul = reply.find('\0');
    require(nul != std::string::npos && reply.compare(0, nul, "SUCCESS") == 0,
            std::string(what) + ": the server answered " + reply.substr(0, 200));
    return reply.substr(nul + 1);
}

// The raw client's reading of a list: one UTF-8 transcoder and the attribute names made once.
class ListWalker {
public:
    ListWalker()
    {
        xercesc::XMLTransService::Codes code;
        transcoder_.reset(xercesc::XMLPlatformUtils::fgTransService->makeNewTranscoderFor("UTF-8", code, 4096));
        require(transcoder_ != nullptr, "no UTF-8 transcoder");
    }

    std::size_t walk(const DOMElement* root, std::vector<ListEntry>& out)
    {
        out.clear();
        for (const DOMElement* e = root->getFirstElementChild(); e != nullptr; e = e->getNextElementSibling()) {
            if (!xercesc::XMLString::equals(e->getTagName(), kFileInfo)) {
                continue;
            }
            ListEntry entry;
            entry.directory = text(e, kFileType) == "DIR";
            entry.size = static_cast<std::uint32_t>(std::stoul(text(e, kSize)));
            entry.date = text(e, kDate);
            const DOMElement* path = e->getFirstElementChild();
            require(path != nullptr && xercesc::XMLString::equals(path->getTagName(), kPath), "FILEINFO without PATH");
            entry.name = text(path, kName);
            entry.directoryPath = text(path, kDirPath);
            entry.absolutePath = text(path, kAbsPath);
            out.push_back(std::move(entry));
        }
        return out.size();
    }

private:
    std::string text(const DOMElement* element, const XMLCh* attribute)
    {
        const XMLCh* value = element->getAttribute(attribute);
        const XMLSize_t length = xercesc::XMLString::stringLen(value);
        std::string out(length * 3, '\0');
        XMLSize_t eaten = 0;
        const XMLSize_t made = transcoder_->transcodeTo(value, length, reinterpret_cast<XMLByte*>(out.data()),
                                                        out.size(), eaten, xercesc::XMLTranscoder::UnRep_RepChar);
        out.resize(made);
        return out;
    }

    static constexpr XMLCh kFileInfo[] = {'F', 'I', 'L', 'E', 'I', 'N', 'F', 'O', 0};
    static constexpr XMLCh kPath[] = {'P', 'A', 'T', 'H', 0};
    static constexpr XMLCh kFileType[] = {'f', 'i', 'l', 'e', 't', 'y', 'p', 'e', 0};
    static constexpr XMLCh kSize[] = {'s', 'i', 'z', 'e', 0};
    static constexpr XMLCh kDate[] = {'d', 'a', 't', 'e', 0};
    static constexpr XMLCh kName[] = {'n', 'a', 'm', 'e', 0};
    static constexpr XMLCh kDirPath[] = {'d', 'i', 'r', 'p', 'a', 't', 'h', 0};
    static constexpr XMLCh kAbsPath[] = {'a', 'b', 's', 'p', 'a', 't', 'h', 0};
    std::unique_ptr<xercesc::XMLTranscoder> transcoder_;
};

}  // namespace

// ---- Raw client -----------------------------------------------------------------------------------

RawClient::RawClient(unsigned short port)
{
    fd_ = ::socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    require(fd_ >= 0 && ::connect(fd_, reinterpret_cast<sockaddr*>(&address), sizeof address) == 0,
            "the raw client cannot connect");
    bodyOf(exchange(signInRequest()), "raw sign-in");
}

RawClient::~RawClient()
{
    if (fd_ >= 0) {
        ::close(fd_);
    }
}

std::string RawClient::exchange(const std::string& requestText)
{
    std::string reply;
    require(sendFrame(fd_, commandPayload(requestText)) && receiveFrame(fd_, reply), "raw exchange failed");
    return reply;
}

void RawClient::repositoryExists()
{
    require(bodyOf(exchange(repositoryExistsRequest()), "raw repositoryExists") == "true", "raw: no repository");
}

void RawClient::upload(const std::string& localPath)
{
    const int file = ::open(localPath.c_str(), O_RDONLY);
    require(file >= 0, "raw upload: cannot open " + localPath);
    const std::unique_ptr<char[]> buffer(new char[kChunk * 2]);
    uLong crc = crc32(0L, Z_NULL, 0);
    std::uint64_t length = 0;
    for (ssize_t got; (got = ::read(file, buffer.get(), kChunk * 2)) > 0; length += static_cast<std::uint64_t>(got)) {
        crc = crc32(crc, reinterpret_cast<const Bytef*>(buffer.get()), static_cast<uInt>(got));
    }
    std::string frame;
    bool good = sendFrame(fd_, commandPayload(uploadRequest())) && receiveFrame(fd_, frame) &&
                frame == acknowledgement() && sendFrame(fd_, fileHeader(length, static_cast<std::uint32_t>(crc))) &&
                receiveFrame(fd_, frame) && frame == acknowledgement() && ::lseek(file, 0, SEEK_SET) == 0;
    for (std::uint64_t sent = 0; good && sent < length;) {
        const ssize_t got = ::read(file, buffer.get(), kChunk);
        good = got > 0 && sendAll(fd_, buffer.get(), static_cast<std::size_t>(got));
        sent += static_cast<std::uint64_t>(got);
    }
    ::close(file);
    require(good && receiveFrame(fd_, frame), "raw upload failed");
    bodyOf(frame, "raw upload");
}

void RawClient::download(const std::string& target)
{
    std::string frame;
    std::uint64_t length = 0;
    std::uint32_t crc = 0;
    require(sendFrame(fd_, commandPayload(downloadRequest())) && receiveFrame(fd_, frame) &&
                parseFileHeader(frame, length, crc) && sendFrame(fd_, acknowledgement()),
            "raw download: no file header");
    const std::string temporary = target + ".raw-part";
    const int file = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL, 0644);
    require(file >= 0, "raw download: cannot create " + temporary);
    const std::unique_ptr<char[]> buffer(new char[kChunk]);
    bool good = true;
    for (std::uint64_t done = 0; good && done < length;) {
        const std::size_t piece = static_cast<std::size_t>(std::min<std::uint64_t>(length - done, kChunk));
        good =
            receiveAll(fd_, buffer.get(), piece) && ::write(file, buffer.get(), piece) == static_cast<ssize_t>(piece);
        done += piece;
    }
    good = ::close(file) == 0 && good && ::rename(temporary.c_str(), target.c_str()) == 0;
    require(good && sendFrame(fd_, acknowledgement()) && receiveFrame(fd_, frame), "raw download failed");
    bodyOf(frame, "raw download");
}

std::size_t RawClient::list(std::vector<ListEntry>& out)
{
    const std::string body = bodyOf(exchange(listRequest()), "raw list");
    xercesc::XercesDOMParser parser;
    xercesc::MemBufInputSource source(reinterpret_cast<const XMLByte*>(body.data()), body.size(), "list", false);
    parser.parse(source);
    const xercesc::DOMDocument* document = parser.getDocument();
    require(parser.getErrorCount() == 0 && document != nullptr && document->getDocumentElement() != nullptr,
            "raw list: the reply does not parse");
    return ListWalker().walk(document->getDocumentElement(), out);
}

// ---- Library client -------------------------------------------------------------------------------

LibraryClient::LibraryClient(unsigned short port, const char* user, const char* password)
{
    require(ZEL_createServerSession(&session_) != nullptr, "no session");
    info_ = session_->createConnectionInfo(text("127.0.0.1"), port, text(user != nullptr ? user : kUser),
                                           text(password != nullptr ? password : kPassword));
    check(session_->init(*info_, nullptr), "sign-in");
}

LibraryClient::~LibraryClient()
{
    for (auto& [name, path] : paths_) {
        mountPoint_->releaseObject(path);
    }
    if (entries_ != nullptr) {
        session_->destroyFileInfoVector(&entries_);
    }
    if (mountPoint_ != nullptr) {
        session_->destroyMountPoint(&mountPoint_);
    }
    for (auto& [value, string] : strings_) {
        session_->destroyString(&string);
    }
    session_->destroyConnectionInfo(&info_);
    ZEL_destroyServerSession(&session_);
}

void LibraryClient::check(IZELServerStatus* status, const char* what)
{
    if (status == nullptr) {
        return;
    }
    const std::string message =
        std::string(what) + ": " + std::to_string(status->getMessageNumber()) + " " + status->getMessage();
    session_->destroyStatus(&status);
    throw std::runtime_error(message);
}

IZELServerString& LibraryClient::text(const std::string& value)
{
    IZELServerString*& string = strings_[value];
    if (string == nullptr) {
        string = session_->createString();
        string->set(value.data(), static_cast<unsigned>(value.size()));
    }
    return *string;
}

IZELServerMountPoint& LibraryClient::mountPoint()
{
    if (mountPoint_ == nullptr) {
        mountPoint_ = session_->createMountPoint();
        unsigned found = 0;
        check(session_->getMountPointManager()->getSharedResource(text(kResource), *mountPoint_, found),
              "getSharedResource");
        require(found != 0, "no shared resource");
    }
    return *mountPoint_;
}

IZELServerPath& LibraryClient::path(const char* absolutePath)
{
    IZELServerPath*& made = paths_[absolutePath];
    if (made == nullptr) {
        made = mountPoint().createPath(text(absolutePath));
    }
    return *made;
}

void LibraryClient::repositoryExists()
{
    unsigned exists = 0;
    check(session_->getRepositoryManager()->repositoryExists(text(kRepository), exists), "repositoryExists");
    require(exists != 0, "library: no repository");
}

void LibraryClient::upload(const std::string& localPath)
{
    check(mountPoint().upload(text(localPath), path(kUploadPath), nullptr), "upload");
}

void LibraryClient::download(const std::string& target)
{
    unsigned received = 0;
    check(mountPoint().download(path(kDownloadPath), text(target), received, nullptr), "download");
    require(received != 0, "library download: no file");
}

std::size_t LibraryClient::list()
{
    if (entries_ == nullptr) {
        entries_ = session_->createFileInfoVector();
    }
    check(mountPoint().list(path(kListPath), *entries_), "list");
    return entries_->entries();
}

}  // namespace bench
