#include "hexeditor/GotoCatalogNodeDlg.h"

namespace HexEditor {

GotoCatalogNodeDlg::GotoCatalogNodeDlg(uint64_t nodeCount, QWidget *parent)
    : GotoNumberDlg(tr("Go to Catalog Node"), tr("Catalog Node:"), nodeCount, parent)
{
    setObjectName(QStringLiteral("GotoCatalogNodeDlg"));
}

} // namespace HexEditor
