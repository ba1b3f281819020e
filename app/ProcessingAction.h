// Carries out what the command line asks for once the application has started: the hardware report,
// or opening a disk, volume, image or file in the hex editor.
#pragma once

#include "ClientFramework/Processing/ActionState.h"

#include <QList>

class NodeCore;

namespace Framework {
class Application;
}

namespace CLI {

class IRequestHost;
struct ContextDevice;

class ProcessingAction : public Framework::ActionState
{
    Q_OBJECT
public:
    enum Result : uint32_t {
        Success = 0,
        HelpShown = 1,
        ReportSaved = 1,
        Failed = 0x10,
        NothingToDo = 0x80,
    };

    // The host is not owned and must outlive the action.
    explicit ProcessingAction(IRequestHost &host, QObject *parent = nullptr);

    // Runs the action one second after the application announces that initialisation completed.
    void runAfterInitialization(Framework::Application *application);
    // Runs the action now (once, and a second time after a file node became ready).
    void run();
    int runs() const { return m_runs; }

    // The device the numbers select: the first whose number within its prefix (counted from 0 in
    // device order) equals disk and whose prefix equals prefix (255 matches any). -1 when none.
    static int selectDevice(const QList<ContextDevice> &devices, int disk, int prefix);

signals:
    // The application should quit (after the help or the hardware report).
    void quitRequested();
    // The final action chosen when the action completed (3: save the log and shut down).
    void finalActionChosen(int action);

private:
    void complete(uint32_t result);
    NodeCore *resolveContext();

    IRequestHost &m_host;
    int m_runs = 0;
};

} // namespace CLI
