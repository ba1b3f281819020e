#include "WindowManager.h"

#include "Views/GenericView.h"

namespace Framework {

WindowManager::WindowManager(QWidget *parent) : QTabWidget(parent)
{
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
}

void WindowManager::registerView(const QString &viewId, Factory factory)
{
    m_factories.insert(viewId, std::move(factory));
}

GenericView *WindowManager::openView(const QString &viewId)
{
    if (GenericView *v = view(viewId)) {
        setCurrentWidget(v);
        return v;
    }
    const Factory factory = m_factories.value(viewId);
    if (!factory)
        return nullptr;
    GenericView *v = factory();
    if (!v)
        return nullptr;
    setCurrentIndex(addTab(v, v->windowIcon(), v->title()));
    emit viewsChanged();
    return v;
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
    return list;
}

} // namespace Framework
