#include "hexeditor/ViewResources.h"

#include <QtGlobal>

#include <mutex>

// Q_INIT_RESOURCE must be used outside of any namespace.
static void initHexEditorResources()
{
    Q_INIT_RESOURCE(hexeditor);
}

namespace HexEditor {

void initViewResources()
{
    static std::once_flag once;
    std::call_once(once, initHexEditorResources);
}

} // namespace HexEditor
