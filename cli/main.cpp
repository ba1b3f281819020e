// brindle-cli: the disk kernel without a window, printing what it finds as text or JSON.
#include <QCoreApplication>
#include <QFile>
#include <QTextStream>

#include <cstdio>

#include "cli/CliCommand.h"

int main(int argc, char **argv)
{
    QCoreApplication app(argc, argv);
    QFile rawOut;
    rawOut.open(stdout, QIODevice::WriteOnly | QIODevice::Unbuffered);
    QTextStream out(stdout);
    QTextStream err(stderr);
    Cli::Io io{out, err, rawOut};
    QStringList args = app.arguments().mid(1);
    int code = Cli::run(args, io);
    out.flush();
    err.flush();
    return code;
}
