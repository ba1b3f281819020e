// The framework half of the main window: menus built from the command registry, the window manager
// with its views and panes, the feature commanders' views, the recent image files, the progress in
// the status bar, and the window state in the settings.
#pragma once

#include "ClientFramework/Settings/PersistenceXML.h"

#include <QMainWindow>
#include <QStringList>

class IFeatureCommander;
class QLabel;
class QMenu;
class QProgressBar;
class QTimer;
class QToolBar;

namespace Core {
class Commander;
}

namespace Framework {

class GenericView;
class RecentFiles;
class WindowManager;

class MainView : public QMainWindow, public IPersistenceXML
{
    Q_OBJECT
public:
    static inline const QString SettingsElement = QStringLiteral("main-view");
    static inline const QString ViewsElement = QStringLiteral("views");
    // The pause after a move, resize or dock change before the window state is written into the
    // settings element.
    static constexpr int StateSaveDelayMs = 1500;

    explicit MainView(Core::Commander *commander, QWidget *parent = nullptr);
    ~MainView() override;

    Core::Commander *commander() const { return m_commander; }
    WindowManager *windowManager() const { return m_windows; }
    RecentFiles *recentFiles() const { return m_recent; }
    // The top-level menu of a title ("&File", ...), or nullptr.
    QMenu *menu(const QString &title) const;
    QMenu *recentMenu() const { return m_recentMenu; }
    // The main toolbar ("mainToolBar"), built from the registry by build().
    QToolBar *mainToolBar() const { return m_toolBar; }

    // Registers the views, builds the menus and connects the commands. The views are opened by
    // load() (the settings' visible views, or the defaults).
    virtual void build();

    // A feature commander: its commands go into the registry, its views to the window manager.
    void addFeature(IFeatureCommander *feature);

    // Progress of background work in the status bar (percent < 0: busy without a measure).
    void showProgress(const QString &text, int percent = -1);
    void clearProgress();
    QLabel *progressLabel() const { return m_progressText; }
    QProgressBar *progressBar() const { return m_progress; }

    // Saves the geometry, the dock state and the view list with each view's element and "visible".
    void save(QDomElement &element, bool flush = false) override;
    // Opens the views marked visible (or the defaults), then restores geometry and dock state; with
    // no geometry saved yet the window takes a share of the screen.
    void load(const QDomElement &element) override;

    // The window's share of the screen's available area on first start, centred.
    static constexpr double FirstStartShare = 0.8;
    // The geometry of a first start within a screen's available area.
    static QRect firstStartGeometry(const QRect &available);

signals:
    // A file of "Recent Disk &Images" was chosen.
    void recentFileChosen(const QString &path);

protected:
    // Adds a menu with the actions of the ids (ids without a command are skipped; "" is a separator).
    QMenu *addCommandMenu(const QString &title, const QStringList &ids);
    virtual void registerViews();
    virtual void buildMenus();
    // The commands of the main toolbar in order ("" is a separator; ids without a command are skipped).
    virtual QStringList toolBarCommands() const { return {}; }
    void buildToolBars();
    virtual void connectCommands();
    // The views opened when the settings name none.
    virtual QStringList defaultViews() const;
    // The view shown first after start-up ("" for none).
    virtual QString initialView() const { return QString(); }
    // Whether a view marked visible in the settings opens again at start.
    virtual bool restoresView(const QString &viewId) const
    {
        (void)viewId;
        return true;
    }

    void moveEvent(QMoveEvent *event) override;
    void resizeEvent(QResizeEvent *event) override;

private:
    void updateWindowsMenu();
    void updateRecentMenu();
    void updateViewMenus();
    void loadViewSettings(GenericView *view);
    void saveWindowState();

    Core::Commander *m_commander;
    WindowManager *m_windows;
    RecentFiles *m_recent;
    QMenu *m_windowsMenu = nullptr;
    QMenu *m_recentMenu = nullptr;
    QMenu *m_viewMenus[3] = {nullptr, nullptr, nullptr};
    QToolBar *m_toolBar = nullptr;
    QTimer *m_stateTimer;
    QLabel *m_progressText;
    QProgressBar *m_progress;
    bool m_loaded = false;
};

} // namespace Framework
