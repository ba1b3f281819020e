// Helpers shared by the tests: scratch folders, running standard tools, reading files.
#pragma once

#include <QByteArray>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>

namespace TestUtil {

struct ToolResult {
    int exitCode = -1;
    QByteArray out;
    QByteArray err;
};

// Runs a program to completion (no shell); exitCode -1 when it could not be started.
ToolResult run(const QString &program, const QStringList &args, int timeoutMs = 120000);

// True when the program is on PATH.
bool haveTool(const QString &program);

// True when the process may attach loop devices (root and /dev/loop-control present).
bool canAttachLoop();

// Writes bytes to a file, replacing it; returns false on failure.
bool writeFile(const QString &path, const QByteArray &data);
QByteArray readFile(const QString &path);

// Path of a built program (brindle, brindle-cli) in the build tree.
QString builtProgram(const QString &name);

} // namespace TestUtil
