#include "Kernel/Implementation/Common/RootEnumSource.h"

IEnumerationSource::~IEnumerationSource() = default;
