#include "hexeditor/GotoMftDlg.h"

namespace HexEditor {

GotoMftDlg::GotoMftDlg(uint64_t recordCount, QWidget *parent)
    : GotoNumberDlg(tr("Go to MFT Record"), tr("MFT Record No:"), recordCount, parent)
{
    setObjectName(QStringLiteral("GotoMftDlg"));
}

} // namespace HexEditor
