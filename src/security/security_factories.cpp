#include "security/security_factories.h"

#include "security/ZELServerSecurityManager.h"

namespace zel {

IZELServerSecurityManager* makeSecurityManager(IZELServerChannel* channel)
{
    return new ZELServerSecurityManager(channel);
}

}  // namespace zel
