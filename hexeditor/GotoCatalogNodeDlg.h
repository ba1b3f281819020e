// "Go to Catalog Node": a catalog node number of an HFS+ storage.
#pragma once

#include "hexeditor/GotoNumberDlg.h"

namespace HexEditor {

class GotoCatalogNodeDlg : public GotoNumberDlg
{
    Q_OBJECT
public:
    // nodeCount: the storage's catalog node count.
    explicit GotoCatalogNodeDlg(uint64_t nodeCount, QWidget *parent = nullptr);
};

} // namespace HexEditor
