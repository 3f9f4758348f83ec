// Uploads a local file into a shared resource of the server, showing the transfer's progress, and
// prints what the server then holds at that path.
//
//   upload_file HOST PORT USER PASSWORD RESOURCE LOCAL_FILE REMOTE_PATH
//
// REMOTE_PATH is rooted at the resource ("/in/data.csv"); its folder is created when missing.

#include <cstdio>
#include <memory>
#include <string>

#include "../common/example_session.h"

namespace {

// Prints whole percentages as they are reached, so a large file does not flood the terminal.
class PercentListener : public IZELServerProgressListener {
public:
    void totalSize(unsigned bytes) override { total_ = bytes; }
    void start() override { std::printf("uploading %u bytes\n", total_); }
    void position(unsigned bytesSoFar) override { report(bytesSoFar); }
    void finish() override { report(total_); }

private:
    void report(unsigned bytes)
    {
        const unsigned percent = total_ == 0 ? 100u : static_cast<unsigned>(100ull * bytes / total_);
        if (percent == shown_)
            return;
        shown_ = percent;
        std::printf("  %3u%%\n", percent);
    }

    unsigned total_ = 0;
    unsigned shown_ = ~0u;
};

// The folder part of a resource path ("/in" for "/in/data.csv"); "/" at the top.
std::string folderOf(const std::string& path)
{
    const std::string::size_type slash = path.find_last_of('/');
    return slash == std::string::npos || slash == 0 ? "/" : path.substr(0, slash);
}

}  // namespace

int main(int argc, char** argv)
{
    if (argc != 8) {
        std::fprintf(stderr, "usage: %s HOST PORT USER PASSWORD RESOURCE LOCAL_FILE REMOTE_PATH\n", argv[0]);
        return 2;
    }
    example::Session session;
    if (!session.signIn(argv[1], argv[2], argv[3], argv[4]))
        return 1;

    const auto resource = session.own(session->createMountPoint());
    const auto info = session.own(session->createFileInfo());
    if (!resource || !info)
        return 1;
    unsigned found = 0;
    if (!session.succeeded(
            session->getMountPointManager()->getSharedResource(*session.text(argv[5]), *resource, found)))
        return 1;
    if (!found) {
        std::fprintf(stderr, "error: the server has no shared resource '%s'\n", argv[5]);
        return 1;
    }
    // Paths belong to the mount point that made them and go back to it.
    const auto release = [&](IZELServerPath* path) { resource->releaseObject(path); };
    const std::unique_ptr<IZELServerPath, decltype(release)> folder(
        resource->createPath(*session.text(folderOf(argv[7]))), release);
    const std::unique_ptr<IZELServerPath, decltype(release)> target(resource->createPath(*session.text(argv[7])),
                                                                    release);
    unsigned present = 0;
    bool done = session.succeeded(resource->exists(*folder, present));
    if (done && !present)
        done = session.succeeded(resource->makeDirectory(*folder));
    PercentListener listener;
    if (done)
        done = session.succeeded(resource->upload(*session.text(argv[6]), *target, &listener));
    if (done)
        done = session.succeeded(resource->getFileInfo(*target, *info));
    if (done) {
        const auto date = session.text();
        info->getDate(*date);
        std::printf("%s:%s holds %u bytes (%s)\n", argv[5], argv[7], info->getSize(), date->c_str());
    }
    return done ? 0 : 1;
}
