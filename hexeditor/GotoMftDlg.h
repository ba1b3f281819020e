// "Go to MFT Record": an MFT record number of an NTFS storage.
#pragma once

#include "hexeditor/GotoNumberDlg.h"

namespace HexEditor {

class GotoMftDlg : public GotoNumberDlg
{
    Q_OBJECT
public:
    // recordCount: the storage's MFT record count.
    explicit GotoMftDlg(uint64_t recordCount, QWidget *parent = nullptr);
};

} // namespace HexEditor
