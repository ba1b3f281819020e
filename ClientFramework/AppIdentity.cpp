// The identity is header-only; this unit gives the framework library its first object file.
#include "ClientFramework/AppIdentity.h"
