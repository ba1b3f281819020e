// The base of every view the window manager hosts: a QMainWindow with a view id and a title.
#pragma once

#include <QMainWindow>

namespace Framework {

class GenericView : public QMainWindow
{
    Q_OBJECT
public:
    GenericView(const QString &viewId, const QString &title, QWidget *parent = nullptr);

    QString viewId() const { return m_viewId; }
    QString title() const { return windowTitle(); }

private:
    QString m_viewId;
};

} // namespace Framework
