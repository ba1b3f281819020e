// Placeholder unit so the application library has an object file before start-up code lands.
#include "ClientFramework/AppIdentity.h"
