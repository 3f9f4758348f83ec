#pragma once
// A repository looked up by name, held for the item, resource and workspace commands.

#include "commands.h"

namespace zelctl {

class OpenRepository {
public:
    explicit OpenRepository(Connection& connection) : connection_(connection) {}

    // Looks the repository up; a name the server does not know is a failure.
    Outcome open(const std::string& name);
    IZELServerRepository& get() { return *repository_; }

private:
    Connection& connection_;
    ZELServerOwned<IZELServerRepository> repository_;
};

}  // namespace zelctl
