// The product's main window: the framework window with this product's views (welcome, Disk
// Explorer, File Browser, property pane) and the handlers of the product's commands.
#pragma once

#include "ClientFramework/Views/MainView.h"

#include <functional>
#include <memory>

class CRoot;
class IBlockDeviceMonitor;
class NodeRoot;

namespace Framework::DeviceChange {
class Handler;
}

namespace Solution {

class Commander;
class DeviceChangeSink;
class NodeCommands;

class MainView : public Framework::MainView
{
    Q_OBJECT
public:
    // What the window asks of the kernel side (set by start-up).
    struct Hooks
    {
        // Opens an image file as a virtual disk; false when refused (the reason is logged).
        std::function<bool(const QString &path)> mountImage;
        // Writes the hardware-information report; false when it could not be written.
        std::function<bool(const QString &path)> saveHardwareInfo;
    };

    static inline const QStringList GettingStarted = {
        QStringLiteral("cmdOpen_Explorer"), QStringLiteral("cmdHex_File"), QStringLiteral("cmdOpen_Browser"),
        QStringLiteral("cmdDI_Mount")};
    static inline const QStringList Support = {QStringLiteral("cmdHelp"), QStringLiteral("cmdWebHelp"),
                                               QStringLiteral("cmdWebRequest"), QStringLiteral("cmdHddInfo"),
                                               QStringLiteral("cmdSettings")};

    explicit MainView(Commander *commander, QWidget *parent = nullptr);
    ~MainView() override;

    // The kernel root the window shows (not owned; set before build()): the node tree over it,
    // the device-change handler and the platform's block-device monitor.
    void setKernel(CRoot *kernel);
    CRoot *kernel() const { return m_kernel; }
    NodeRoot *nodeRoot() const { return m_nodes.get(); }
    // The handlers of the node commands (Reload, Stop, Select All, ...), made by build().
    NodeCommands *nodeCommands() const { return m_nodeCommands; }
    // The main toolbar's commands.
    static const QStringList ToolBar;
    Framework::DeviceChange::Handler *deviceChange() const { return m_deviceChange.get(); }
    IBlockDeviceMonitor *blockMonitor() const { return m_monitor.get(); }

    void setHooks(Hooks hooks) { m_hooks = std::move(hooks); }

    // Mounts an image file as with "Open Disk Image...": remembered in "Recent Disk &Images" when
    // it opens.
    bool mountImage(const QString &path);

    void load(const QDomElement &element) override;

protected:
    void registerViews() override;
    void connectCommands() override;
    QStringList defaultViews() const override;
    QString initialView() const override;
    bool restoresView(const QString &viewId) const override;
    QStringList toolBarCommands() const override { return ToolBar; }

private:
    bool welcomeAtStart() const;
    void removeSelectedImages();

    Hooks m_hooks;
    CRoot *m_kernel = nullptr;
    std::unique_ptr<NodeRoot> m_nodes;
    std::unique_ptr<DeviceChangeSink> m_sink;
    std::unique_ptr<Framework::DeviceChange::Handler> m_deviceChange;
    std::unique_ptr<IBlockDeviceMonitor> m_monitor;
    QString m_notReadyTip;
    NodeCommands *m_nodeCommands = nullptr;
};

} // namespace Solution
