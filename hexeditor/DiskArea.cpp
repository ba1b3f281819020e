// DiskArea is header-only; this unit gives the hex-editor library its first object file.
#include "hexeditor/DiskArea.h"
