// zelbench: the library against a raw client doing byte-identical exchanges with the same server,
// interleaved run by run, plus the figures of the local server zelserverd. Prints a Markdown table
// of medians, ratios and goals together with the machine's load. Run it through bench/run.sh.

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <map>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include <xercesc/util/PlatformUtils.hpp>

#include "canned_server.h"
#include "clients.h"
#include "measure.h"
#include "wire.h"
#include "zelserverd_figures.h"

namespace bench {
namespace {

constexpr double kMiB = 1024.0 * 1024.0;

struct Options {
    std::uint64_t transferMiB = 1024;
    std::uint64_t memoryMiB = 2048;
    unsigned entries = 10000;
    unsigned rounds = 9;
    unsigned transferRounds = 5;
    unsigned calls = 2000;
    ServerFigureOptions server;
    std::set<std::string> only;

    bool wants(const std::string& figure) const { return only.empty() || only.count(figure) != 0; }
};

const char* const kUsage =
    "usage: zelbench [--quick] [--size-mib N] [--memory-mib N] [--entries N] [--rounds N]\n"
    "                [--transfer-rounds N] [--calls N] [--jobs N] [--seconds S] [--work DIR]\n"
    "                [--zelserverd PATH] [--only roundtrip,upload,download,list,memory,zelserverd]\n";

Options parse(int argc, char** argv)
{
    Options o;
    o.server.zelserverd = (std::filesystem::path(argv[0]).parent_path() / "zelserverd").string();
    o.server.workDir = (std::filesystem::temp_directory_path() / ("zelbench-" + std::to_string(::getpid()))).string();
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        auto next = [&]() -> std::string {
            if (i + 1 >= argc) {
                throw std::invalid_argument(arg + " needs a value");
            }
            return argv[++i];
        };
        if (arg == "--quick") {
            o.transferMiB = 1;
            o.memoryMiB = 2;
            o.entries = 100;
            o.rounds = 3;
            o.transferRounds = 3;
            o.calls = 50;
            o.server.jobs = 3;
            o.server.uploads = 3;
            o.server.seconds = 0.2;
        } else if (arg == "--size-mib") {
            o.transferMiB = std::stoull(next());
        } else if (arg == "--memory-mib") {
            o.memoryMiB = std::stoull(next());
        } else if (arg == "--entries") {
            o.entries = static_cast<unsigned>(std::stoul(next()));
        } else if (arg == "--rounds") {
            o.rounds = static_cast<unsigned>(std::stoul(next()));
        } else if (arg == "--transfer-rounds") {
            o.transferRounds = static_cast<unsigned>(std::stoul(next()));
        } else if (arg == "--calls") {
            o.calls = static_cast<unsigned>(std::stoul(next()));
        } else if (arg == "--jobs") {
            o.server.jobs = static_cast<unsigned>(std::stoul(next()));
        } else if (arg == "--seconds") {
            o.server.seconds = std::stod(next());
        } else if (arg == "--work") {
            o.server.workDir = next();
        } else if (arg == "--zelserverd") {
            o.server.zelserverd = next();
        } else if (arg == "--only") {
            std::stringstream list(next());
            for (std::string figure; std::getline(list, figure, ',');) {
                o.only.insert(figure);
            }
        } else {
            throw std::invalid_argument("unknown option " + arg);
        }
    }
    if (o.transferMiB == 0 || o.transferMiB >= 4096 || o.rounds == 0 || o.transferRounds == 0 || o.calls == 0) {
        throw std::invalid_argument("sizes and counts must be positive, transfers below 4 GiB");
    }
    return o;
}

void progress(const std::string& figure) { std::fprintf(stderr, "zelbench: %s\n", figure.c_str()); }

// Time per operation: the ratio is library over raw, lower is better.
Row timeRow(const std::string& figure, const Samples& s, double scale, const char* unit, double goal)
{
    const double library = median(s.library), raw = median(s.raw), ratio = library / raw;
    return {figure,          fixed(library * scale, 1) + unit, fixed(raw * scale, 1) + unit,
            fixed(ratio, 2), "<= " + fixed(goal, 2),           metText(ratio <= goal)};
}

// Throughput: the ratio is library over raw, higher is better.
Row rateRow(const std::string& figure, const Samples& s, double bytes, double goal)
{
    const double library = bytes / median(s.library) / kMiB, raw = bytes / median(s.raw) / kMiB;
    return {figure,
            fixed(library, 0) + " MiB/s",
            fixed(raw, 0) + " MiB/s",
            fixed(library / raw, 2),
            ">= " + fixed(goal, 2),
            metText(library / raw >= goal)};
}

void checkDownload(const std::string& path, std::uint64_t size)
{
    std::uint32_t crc = 0;
    std::uint64_t length = 0;
    if (!fileCrc(path, crc, length) || length != size || crc != contentCrc(size)) {
        throw std::runtime_error("a download arrived damaged: " + path);
    }
    std::filesystem::remove(path);
}

void run(const Options& o)
{
    std::filesystem::create_directories(o.server.workDir);
    const std::uint64_t size = o.transferMiB << 20;
    // Before the canned server starts, so that it shares the client's CPU; zelserverd's figures
    // are about its threads, so they run free.
    OneCpu pinned;
    const CannedServer server({size, o.entries});
    xercesc::XMLPlatformUtils::Initialize();
    const std::string loadBefore = loadText();
    std::vector<Row> rows;
    {
        LibraryClient library(server.port());
        RawClient raw(server.port());
        const std::string uploadFile = o.server.workDir + "/upload.dat";
        const std::string target = o.server.workDir + "/download.dat";
        if (o.wants("roundtrip")) {
            progress("small command round trip");
            const auto many = [&](const std::function<void()>& call) {
                return [&, call] {
                    for (unsigned i = 0; i < o.calls; ++i) {
                        call();
                    }
                };
            };
            const Samples s =
                interleave(o.rounds, many([&] { library.repositoryExists(); }), many([&] { raw.repositoryExists(); }));
            rows.push_back(timeRow("small command round trip (repositoryExists)", s, 1e6 / o.calls, " µs", 1.10));
        }
        if (o.wants("upload") || o.wants("memory")) {
            writeContentFile(uploadFile, size);
        }
        if (o.wants("upload")) {
            progress("upload");
            const Samples s = interleave(
                o.transferRounds, [&] { library.upload(uploadFile); }, [&] { raw.upload(uploadFile); });
            rows.push_back(rateRow("upload of " + std::to_string(o.transferMiB) + " MiB through a mount point", s,
                                   static_cast<double>(size), 0.85));
        }
        if (o.wants("download")) {
            progress("download");
            const Samples s = interleave(
                o.transferRounds, [&] { library.download(target); }, [&] { raw.download(target); },
                [&] { checkDownload(target, size); });
            rows.push_back(rateRow("download of " + std::to_string(o.transferMiB) + " MiB through a mount point", s,
                                   static_cast<double>(size), 0.85));
        }
        if (o.wants("list")) {
            progress("list");
            std::vector<ListEntry> entries;
            const Samples s = interleave(
                o.rounds,
                [&] {
                    if (library.list() != o.entries) {
                        throw std::runtime_error("the library listed the wrong number of entries");
                    }
                },
                [&] {
                    if (raw.list(entries) != o.entries) {
                        throw std::runtime_error("the raw client listed the wrong number of entries");
                    }
                });
            rows.push_back(timeRow(std::to_string(o.entries) + "-entry list reply into objects", s, 1e3, " ms", 1.30));
        }
        if (o.wants("memory")) {
            progress("memory");
            const std::uint64_t times = std::max<std::uint64_t>(1, o.memoryMiB / o.transferMiB);
            resetPeakResident();
            const long before = residentBytes();
            for (std::uint64_t i = 0; i < times; ++i) {
                library.upload(uploadFile);
                library.download(target);
                checkDownload(target, size);
            }
            const double growth = static_cast<double>(peakResidentBytes() - before) / kMiB;
            rows.push_back({"memory growth, " + std::to_string(times * o.transferMiB) + " MiB each way",
                            fixed(growth, 2) + " MiB", "", "", "< 8 MB", metText(growth * kMiB < 8e6)});
        }
        std::filesystem::remove(uploadFile);
    }
    pinned.release();
    if (o.wants("zelserverd")) {
        progress("zelserverd");
        if (std::filesystem::exists(o.server.zelserverd)) {
            measureZelserverd(o.server, rows);
        } else {
            rows.push_back({"zelserverd figures", "not measured: no " + o.server.zelserverd, "", "", "", "NO"});
        }
    }
    xercesc::XMLPlatformUtils::Terminate();
    std::filesystem::remove_all(o.server.workDir);
    printTable(rows, loadBefore, loadText());
    std::printf("library and raw client with their canned server: %s\n", pinned.text().c_str());
}

}  // namespace
}  // namespace bench

int main(int argc, char** argv)
{
    try {
        bench::run(bench::parse(argc, argv));
        return 0;
    } catch (const std::invalid_argument& e) {
        std::fprintf(stderr, "zelbench: %s\n%s", e.what(), bench::kUsage);
        return 2;
    } catch (const std::exception& e) {
        std::fprintf(stderr, "zelbench: %s\n", e.what());
        return 1;
    }
}
