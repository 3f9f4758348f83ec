#pragma once
// What the session makes of this subsystem. Each returns a new object the caller owns, or null when
// memory is exhausted.

#include <zelserverapi/IZELServerSecurityManager.h>

#include "transport/IZELServerChannel.h"

namespace zel {

// Bound to `channel`, which it borrows: the channel must outlive the manager.
IZELServerSecurityManager* makeSecurityManager(IZELServerChannel* channel);

}  // namespace zel
