// The application object: the QApplication with its names, the settings document and the log, the
// persistent components, and what the run recorded (errors, warnings, the final action).
#pragma once

#include "ClientFramework/Settings/PersistenceXML.h"

#include <QList>
#include <QObject>
#include <QPair>

#include <memory>

class QApplication;

namespace Framework {

class Application : public QObject
{
    Q_OBJECT
public:
    // Constructs the QApplication of the process.
    Application(int &argc, char **argv);
    // Uses a QApplication that exists already (not owned).
    explicit Application(QApplication *existing);
    ~Application() override;

    static Application *instance();
    QApplication *application() const { return m_app; }

    // Adds a component kept in the settings element of the given name (not owned); its state is
    // loaded now and saved by saveState().
    void registerComponent(const QString &element, IPersistenceXML *component);
    // Saves every component into its element and writes the settings file.
    void saveState();

    // Logs "Application initialization completed" and announces it.
    void initializationCompleted();

    // 1 when an error was logged since the application was made, else 2 after a warning, else 0.
    // Warnings about normal conditions (logCondition) do not count.
    int exitCode() const;

    // Logs a warning about a normal condition of the machine, such as a disk this process may not
    // open: it shows like any warning but leaves the run's exit status alone.
    void logCondition(const QString &text);
    int conditionCount() const { return m_conditions; }

    // What to do when the command-line work is done (0 nothing, 3 save the log and shut down).
    void setFinalAction(int action) { m_finalAction = action; }
    int finalAction() const { return m_finalAction; }

signals:
    void initialized();

private:
    void open();

    std::unique_ptr<QApplication> m_owned;
    QApplication *m_app = nullptr;
    QList<QPair<QString, IPersistenceXML *>> m_components;
    int m_errorsAtStart = 0;
    int m_warningsAtStart = 0;
    int m_conditions = 0;
    int m_finalAction = 0;
};

} // namespace Framework
