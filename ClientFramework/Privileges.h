// Whether the process has the rights the welcome and about pages report as "Administrator Rights".
#pragma once

namespace Framework {

// True when the process may open block devices for reading: it runs as root or belongs to the
// "disk" group.
bool hasAdministratorRights();

} // namespace Framework
