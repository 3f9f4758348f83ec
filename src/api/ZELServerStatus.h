#pragma once
// The library's status object: a catalogue number, its filled-in text and a secondary code.
// Made through the factories of api/status.h; the caller owns it and destroys it through its
// virtual destructor (IZELServerSession::destroyStatus).

#include <string>
#include <vector>

#include <zelserverapi/IZELServerStatus.h>

#include "api/heap.h"

namespace zel {

class ZELServerStatus final : public IZELServerStatus, public HeapObject {
public:
    explicit ZELServerStatus(unsigned number);
    ZELServerStatus(unsigned number, const std::vector<std::string>& parameters);
    ZELServerStatus(unsigned number, const std::string& parameter);
    ZELServerStatus(unsigned code, unsigned number);
    ZELServerStatus(unsigned code, unsigned number, const std::string& parameter);
    ~ZELServerStatus() override;

    ZELServerStatus(const ZELServerStatus&) = delete;
    ZELServerStatus& operator=(const ZELServerStatus&) = delete;

    const char* getMessage() const override { return message_.c_str(); }
    unsigned getMessageNumber() const override { return number_; }
    unsigned getCode() const override { return code_; }

private:
    void build(const std::vector<std::string>& parameters);

    std::string message_;
    unsigned number_ = 0;
    unsigned code_ = 0;
};

}  // namespace zel
