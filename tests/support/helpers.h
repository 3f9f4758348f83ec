#pragma once
// Small helpers shared by the library's suites.

#include <cstddef>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

#include <zelserverapi/IZELServerProgressListener.h>
#include <zelserverapi/IZELServerStatus.h>

#include "api/ZELServerStatus.h"

namespace zeltest {

// Records the progress calls in order.
class ProgressLog final : public IZELServerProgressListener {
public:
    void totalSize(unsigned bytes) override { calls.push_back("total " + std::to_string(bytes)); }
    void start() override { calls.push_back("start"); }
    void position(unsigned bytes) override { calls.push_back("at " + std::to_string(bytes)); }
    void finish() override { calls.push_back("finish"); }
    std::vector<std::string> calls;
};

// Content that is neither constant nor periodic within a chunk, so a shifted or repeated piece shows.
inline std::string pattern(std::size_t size)
{
    std::string data(size, '\0');
    for (std::size_t i = 0; i < size; ++i) {
        data[i] = static_cast<char>((i * 131 + i / 509) & 0xFF);
    }
    return data;
}

inline std::string slurp(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
}

inline void spew(const std::filesystem::path& path, const std::string& content)
{
    std::ofstream(path, std::ios::binary) << content;
}

// Number, code and text of a status, for failure messages.
inline std::string describe(const IZELServerStatus* status)
{
    if (status == nullptr) {
        return "(no status)";
    }
    std::string text = std::to_string(status->getMessageNumber()) + " code " + std::to_string(status->getCode()) +
                       ": " + status->getMessage();
    // Where the library made it, so that a failing test points at the line that failed.
    if (const auto* own = dynamic_cast<const zel::ZELServerStatus*>(status)) {
        const std::string_view file = own->where().file_name();
        const std::size_t src = file.rfind("src/");
        text += " [made at " + std::string(src == std::string_view::npos ? file : file.substr(src)) + ":" +
                std::to_string(own->where().line()) + "]";
    }
    return text;
}

}  // namespace zeltest
