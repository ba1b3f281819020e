#include "tests/common/TestUtil.h"

#include <QFile>
#include <QFileInfo>
#include <QProcess>
#include <QStandardPaths>

#include <cstdint>
#include <unistd.h>

namespace TestUtil {

ToolResult run(const QString &program, const QStringList &args, int timeoutMs)
{
    ToolResult r;
    QProcess p;
    p.start(program, args);
    if (!p.waitForStarted(10000))
        return r;
    p.closeWriteChannel();
    if (!p.waitForFinished(timeoutMs)) {
        p.kill();
        p.waitForFinished();
        return r;
    }
    r.out = p.readAllStandardOutput();
    r.err = p.readAllStandardError();
    r.exitCode = p.exitStatus() == QProcess::NormalExit ? p.exitCode() : -1;
    return r;
}

bool haveTool(const QString &program)
{
    return !QStandardPaths::findExecutable(program).isEmpty() ||
           !QStandardPaths::findExecutable(program, {"/usr/sbin", "/sbin"}).isEmpty();
}

bool canAttachLoop()
{
    return geteuid() == 0 && QFileInfo::exists("/dev/loop-control") && haveTool("losetup");
}

bool writeFile(const QString &path, const QByteArray &data)
{
    QFile f(path);
    if (!f.open(QIODevice::WriteOnly | QIODevice::Truncate))
        return false;
    return f.write(data) == data.size();
}

QByteArray readFile(const QString &path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadOnly))
        return {};
    return f.readAll();
}

QByteArray randomBytes(int size, unsigned seed)
{
    QByteArray b(size, Qt::Uninitialized);
    std::uint32_t x = seed;
    for (auto &c : b) {
        x = x * 1103515245u + 12345u;
        c = char(x >> 16);
    }
    if (size >= 512)
        b[510] = b[511] = 0;
    return b;
}

QString builtProgram(const QString &name)
{
    for (const char *dir : {"/app/", "/cli/"}) {
        QString p = QStringLiteral(BRINDLE_BINARY_DIR) + dir + name;
        if (QFileInfo(p).isExecutable())
            return p;
    }
    return {};
}

} // namespace TestUtil
