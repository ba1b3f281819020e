#include "ClientFramework/Views/GenericView.h"

namespace Framework {

GenericView::GenericView(const QString &viewId, const QString &title, QWidget *parent)
    : QMainWindow(parent), m_viewId(viewId)
{
    setObjectName(viewId);
    setWindowTitle(title);
    setWindowFlags(Qt::Widget);
}

} // namespace Framework
