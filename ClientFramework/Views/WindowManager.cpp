#include "ClientFramework/Views/WindowManager.h"

#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Views/GenericView.h"
#include "ClientFramework/Views/INodeSource.h"

#include <QDockWidget>
#include <QMainWindow>

namespace Framework {

WindowManager::WindowManager(QMainWindow *host, QWidget *parent) : QTabWidget(parent), m_host(host)
{
    setObjectName(QStringLiteral("WindowManager"));
    setDocumentMode(true);
    setTabsClosable(true);
    setMovable(true);
    connect(this, &QTabWidget::tabCloseRequested, this, [this](int index) {
        QWidget *w = widget(index);
        removeTab(index);
        if (w)
            w->deleteLater();
        emit viewsChanged();
    });
    connect(this, &QTabWidget::currentChanged, this, &WindowManager::onCurrentChanged);
}

WindowManager::~WindowManager()
{
    // The tab views are destroyed after this object's members: they must not call back.
    for (GenericView *v : findChildren<GenericView *>())
        disconnect(v, nullptr, this, nullptr);
    for (QDockWidget *d : std::as_const(m_docks))
        if (d->widget())
            disconnect(d->widget(), nullptr, this, nullptr);
}

void WindowManager::registerView(const QString &viewId, Factory factory, Placement placement)
{
    if (!m_factories.contains(viewId))
        m_order.append(viewId);
    m_factories.insert(viewId, std::move(factory));
    m_placements.insert(viewId, m_host ? placement : Placement::Tab);
}

GenericView *WindowManager::openView(const QString &viewId)
{
    if (GenericView *v = view(viewId)) {
        if (QDockWidget *d = dock(viewId)) {
            d->show();
            d->raise();
        } else {
            setCurrentWidget(v);
        }
        return v;
    }
    const Factory factory = m_factories.value(viewId);
    if (!factory)
        return nullptr;
    GenericView *v = factory();
    if (!v)
        return nullptr;
    addView(v, placement(viewId));
    return v;
}

void WindowManager::addView(GenericView *v, Placement where)
{
    if (!v)
        return;
    const QString viewId = v->viewId();
    if (!m_host)
        where = Placement::Tab;
    adopt(v);
    emit viewCreated(v);
    if (where == Placement::Tab) {
        setCurrentIndex(addTab(v, v->windowIcon(), v->title()));
    } else {
        auto *d = new QDockWidget(v->title(), m_host);
        d->setObjectName(viewId);
        d->setWidget(v);
        const Qt::DockWidgetArea area = where == Placement::DockLeft    ? Qt::LeftDockWidgetArea
                                        : where == Placement::DockRight ? Qt::RightDockWidgetArea
                                                                        : Qt::BottomDockWidgetArea;
        m_host->addDockWidget(area, d);
        m_docks.insert(viewId, d);
        connect(d, &QDockWidget::visibilityChanged, this, &WindowManager::viewsChanged);
        d->show();
    }
    emit viewsChanged();
}

bool WindowManager::closeView(const QString &viewId)
{
    GenericView *v = view(viewId);
    if (!v)
        return false;
    if (QDockWidget *d = dock(viewId)) {
        d->hide();
    } else {
        removeTab(indexOf(v));
        v->deleteLater();
    }
    emit viewsChanged();
    return true;
}

void WindowManager::adopt(GenericView *v)
{
    connect(v, &GenericView::nodeSelectionChanged, this, [this, v](const QList<NodeCore *> &nodes) {
        if (activeView() == v)
            emit selectionChanged(dynamic_cast<INodeSource *>(v), nodes);
    });
    connect(v, &QObject::destroyed, this, [this, v] {
        for (auto it = m_docks.begin(); it != m_docks.end(); ++it)
            if (it.value()->widget() == v) {
                m_docks.erase(it);
                break;
            }
    });
}

void WindowManager::onCurrentChanged()
{
    GenericView *v = activeView();
    emit activeViewChanged(v);
    auto *source = dynamic_cast<INodeSource *>(v);
    emit selectionChanged(source, source ? source->selectedNodes() : QList<NodeCore *>());
}

GenericView *WindowManager::view(const QString &viewId) const
{
    for (GenericView *v : views())
        if (v->viewId() == viewId)
            return v;
    return nullptr;
}

QList<GenericView *> WindowManager::views() const
{
    QList<GenericView *> list;
    for (int i = 0; i < count(); ++i)
        if (auto *v = qobject_cast<GenericView *>(widget(i)))
            list.append(v);
    for (const QString &id : m_order)
        if (QDockWidget *d = m_docks.value(id, nullptr))
            if (auto *v = qobject_cast<GenericView *>(d->widget()))
                list.append(v);
    return list;
}

bool WindowManager::isShown(const GenericView *v) const
{
    if (!v)
        return false;
    if (QDockWidget *d = dock(v->viewId()))
        return !d->isHidden();
    return indexOf(const_cast<GenericView *>(v)) >= 0;
}

GenericView *WindowManager::activeView() const
{
    return qobject_cast<GenericView *>(currentWidget());
}

void WindowManager::openInBrowser(NodeCore *node)
{
    ApplicationLog::instance().add(
        tr("Opening in File Browser: %1").arg(m_nodeName ? m_nodeName(node) : QString()));
    if (!openView(QStringLiteral("browser")))
        return;
    emit browseRequested(node);
}

} // namespace Framework
