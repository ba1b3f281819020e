// The headless companion's commands: each is a name, a one-line summary and a function.
#pragma once

#include <QList>
#include <QStringList>
#include <QTextStream>

class QIODevice;

namespace Cli {

// Where a command writes: text streams for normal output and errors, and the raw
// output device for commands that print bytes (read --raw).
struct Io {
    QTextStream &out;
    QTextStream &err;
    QIODevice &rawOut;
};

// Exit codes shared by every command.
enum Exit { Ok = 0, Failed = 1, Usage = 2 };

struct Command {
    const char *name;
    const char *usage;   // the arguments after the name, for --help
    const char *summary; // one line, for --help
    int (*run)(const QStringList &args, Io &io);
};

// Every command in the order --help lists them.
const QList<Command> &commands();

// Runs the command line `args` (the program name excluded); returns the exit code.
int run(const QStringList &args, Io &io);

} // namespace Cli
