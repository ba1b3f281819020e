#include "RootEnumSource.h"

IEnumerationSource::~IEnumerationSource() = default;
