// The base of every view the window manager hosts, as a tab or as a dock pane: a QMainWindow with a
// view id and a title, its own menu actions and its own settings element below "views".
#pragma once

#include "ClientFramework/Settings/PersistenceXML.h"
#include "ClientFramework/Views/INodeSource.h"
#include "ClientFramework/Views/IWidgetActions.h"

#include <QList>
#include <QMainWindow>

class NodeCore;

namespace Framework {

class GenericView : public QMainWindow, public IPersistenceXML, public IWidgetActions
{
    Q_OBJECT
public:
    GenericView(const QString &viewId, const QString &title, QWidget *parent = nullptr);

    QString viewId() const { return m_viewId; }
    QString title() const { return windowTitle(); }

    // IPersistenceXML: the view's element below "views" (nothing kept by default).
    void save(QDomElement &element, bool flush = false) override
    {
        (void)element;
        (void)flush;
    }
    void load(const QDomElement &element) override { (void)element; }

signals:
    // A view that shows nodes (INodeSource) announces its selection.
    void nodeSelectionChanged(const QList<NodeCore *> &nodes);
    // The view's menu actions changed (the main window rebuilds the view menus).
    void widgetActionsChanged();

private:
    QString m_viewId;
};

} // namespace Framework
