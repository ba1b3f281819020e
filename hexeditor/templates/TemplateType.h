// Template kinds: the table lives with the widget-free template code.
#pragma once

#include "hexeditor/templates/core/TemplateType.h"
