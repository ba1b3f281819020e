#include "ClientFramework/Privileges.h"

#include <grp.h>
#include <unistd.h>

#include <vector>

namespace Framework {

bool hasAdministratorRights()
{
    if (geteuid() == 0)
        return true;
    const group *disk = getgrnam("disk");
    if (!disk)
        return false;
    if (getegid() == disk->gr_gid)
        return true;
    const int n = getgroups(0, nullptr);
    if (n <= 0)
        return false;
    std::vector<gid_t> groups(static_cast<size_t>(n));
    const int got = getgroups(n, groups.data());
    for (int i = 0; i < got; ++i)
        if (groups[static_cast<size_t>(i)] == disk->gr_gid)
            return true;
    return false;
}

} // namespace Framework
