// The program's start-up and run, from the argument object to the end of the event loop.
#pragma once

#include "ClientFramework/SingleInstanceGuard.h"

#include <QString>
#include <QStringList>

#include <functional>

class CRoot;
class QApplication;

namespace Solution {

class Startup
{
public:
    struct Options
    {
        // An application object that exists already (used instead of creating one; not owned).
        QApplication *application = nullptr;
        QString instanceKey = Framework::SingleInstanceGuard::DefaultKey;
        bool runEventLoop = true;
        // Called with the disk kernel's root once it is set up for the run (tests look at it).
        std::function<void(CRoot &)> kernelReady;
    };

    Startup() = default;
    explicit Startup(Options options) : m_options(std::move(options)) {}

    // Runs the program with the process arguments; returns the exit code.
    int run(int &argc, char **argv);
    // Runs with an argument list (program path first); argc and argv go to the application object
    // when one is created.
    int run(const QStringList &arguments, int &argc, char **argv);

private:
    Options m_options;
};

} // namespace Solution
