// Hosts the views of the main window as tabs, each registered under a view id and created on first
// request.
#pragma once

#include <QHash>
#include <QList>
#include <QTabWidget>

#include <functional>

namespace Framework {

class GenericView;

class WindowManager : public QTabWidget
{
    Q_OBJECT
public:
    using Factory = std::function<GenericView *()>;

    explicit WindowManager(QWidget *parent = nullptr);

    // Makes a view id known; the factory builds the view when it is first opened.
    void registerView(const QString &viewId, Factory factory);
    // Creates the view on first request and activates it afterwards; nullptr for an unknown id.
    GenericView *openView(const QString &viewId);
    // The open view of an id, or nullptr.
    GenericView *view(const QString &viewId) const;
    QList<GenericView *> views() const;

signals:
    void viewsChanged();

private:
    QHash<QString, Factory> m_factories;
};

} // namespace Framework
