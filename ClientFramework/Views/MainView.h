// The framework half of the main window: menus built from the command registry, the window manager
// with its views, and the window state in the settings.
#pragma once

#include "Settings/PersistenceXML.h"

#include <QMainWindow>

class QMenu;

namespace Core {
class Commander;
}

namespace Framework {

class WindowManager;

class MainView : public QMainWindow, public IPersistenceXML
{
    Q_OBJECT
public:
    static inline const QString SettingsElement = QStringLiteral("main-view");

    explicit MainView(Core::Commander *commander, QWidget *parent = nullptr);

    Core::Commander *commander() const { return m_commander; }
    WindowManager *windowManager() const { return m_windows; }
    // The top-level menu of a title ("&File", ...), or nullptr.
    QMenu *menu(const QString &title) const;

    // Builds the menus and opens the initial views.
    virtual void build();

    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

protected:
    // Adds a menu with the actions of the ids (ids without a command are skipped; "" is a separator).
    QMenu *addCommandMenu(const QString &title, const QStringList &ids);
    virtual void buildMenus();
    virtual void connectCommands();

private:
    void updateWindowsMenu();

    Core::Commander *m_commander;
    WindowManager *m_windows;
    QMenu *m_windowsMenu = nullptr;
};

} // namespace Framework
