#include "api/ZELServerStatus.h"

namespace zel {

ZELServerStatus::ZELServerStatus(unsigned number) : number_(number) { build({}); }

ZELServerStatus::ZELServerStatus(unsigned number, const std::vector<std::string>& parameters)
    : number_(number) {
    build(parameters);
}

ZELServerStatus::ZELServerStatus(unsigned number, const std::string& parameter) : number_(number) {
    build({parameter});
}

ZELServerStatus::ZELServerStatus(unsigned code, unsigned number) : number_(number), code_(code) {
    build({});
}

ZELServerStatus::ZELServerStatus(unsigned code, unsigned number, const std::string& parameter)
    : number_(number), code_(code) {
    build({parameter});
}

ZELServerStatus::~ZELServerStatus() = default;

void ZELServerStatus::build(const std::vector<std::string>& /*parameters*/) {
    message_ = "Could not load resource: " + std::to_string(number_);
}

}  // namespace zel
