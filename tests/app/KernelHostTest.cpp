// The program's kernel requests from the command line: "-test" writes the hardware report and quits,
// "-mountdi" opens an image as a virtual disk during start-up (and refuses a file that is no image).
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include <QProcess>
#include <QProcessEnvironment>
#include <QThread>
#include <gtest/gtest.h>

namespace {

struct ProgramRun
{
    QString program;
    ScratchHome home;
    QProcess process;

    bool start(const QStringList &args)
    {
        program = TestUtil::builtProgram("brindle");
        if (program.isEmpty())
            return false;
        QProcessEnvironment env = QProcessEnvironment::systemEnvironment();
        env.insert("QT_QPA_PLATFORM", "offscreen");
        env.insert("XDG_CONFIG_HOME", home.path() + "/config");
        env.insert("XDG_DATA_HOME", home.path() + "/data");
        env.insert("ASAN_OPTIONS", "detect_leaks=0");
        process.setProcessEnvironment(env);
        process.start(program, args);
        return process.waitForStarted(10000);
    }
    QString log() const
    {
        return QString::fromUtf8(TestUtil::readFile(home.path() + "/data/Orvane/Brindle/brindle.log"));
    }
    // Waits until the log holds `text`; false after 20 seconds.
    bool waitForLog(const QString &text) const
    {
        for (int i = 0; i < 200; ++i) {
            if (log().contains(text))
                return true;
            QThread::msleep(100);
        }
        return false;
    }
    void stop()
    {
        if (process.state() != QProcess::NotRunning) {
            process.terminate();
            if (!process.waitForFinished(20000)) {
                process.kill();
                process.waitForFinished(5000);
            }
        }
    }
    ~ProgramRun() { stop(); }
};

} // namespace

TEST(KernelRequests, TestOptionWritesAWellFormedReportAndQuits)
{
    ProgramRun run;
    const QString report = run.home.path() + "/hddinfo.xml";
    ASSERT_TRUE(run.start({"-test=" + report}));
    ASSERT_TRUE(run.process.waitForFinished(120000)) << run.log().toStdString();
    ASSERT_FALSE(run.log().contains("is already running")) << "another Brindle is running";
    const QByteArray xml = TestUtil::readFile(report);
    ASSERT_FALSE(xml.isEmpty()) << run.log().toStdString();
    EXPECT_TRUE(xml.contains("<hardware_info>"));
    EXPECT_TRUE(xml.contains("<kernel>14.04.23</kernel>"));
    if (TestUtil::haveTool("xmllint")) {
        TestUtil::ToolResult lint = TestUtil::run("xmllint", {"--noout", report});
        EXPECT_EQ(lint.exitCode, 0) << lint.err.toStdString();
    }
    EXPECT_TRUE(run.log().contains("Hardware information saved to '" + report + "'"));
}

TEST(KernelRequests, MountDiskImageOpensItAtStartAndRefusesOtherFiles)
{
    // A 2 MiB raw disk with a boot-record signature.
    QTemporaryDir dir;
    QByteArray disk(2 * 1024 * 1024, '\0');
    disk[510] = char(0x55);
    disk[511] = char(0xAA);
    const QString image = dir.filePath("disk.img");
    ASSERT_TRUE(TestUtil::writeFile(image, disk));
    {
        ProgramRun run;
        ASSERT_TRUE(run.start({"-mountdi=" + image}));
        ASSERT_TRUE(run.waitForLog("Application initialization completed")) << run.log().toStdString();
        ASSERT_FALSE(run.log().contains("is already running")) << "another Brindle is running";
        EXPECT_TRUE(run.log().contains("Disk Image has been opened successfully."))
            << run.log().toStdString();
    }
    const QString text = dir.filePath("notes.txt");
    ASSERT_TRUE(TestUtil::writeFile(text, "not a disk image"));
    ProgramRun run;
    ASSERT_TRUE(run.start({"-mountdi=" + text}));
    ASSERT_TRUE(run.waitForLog("Application initialization completed")) << run.log().toStdString();
    EXPECT_TRUE(run.log().contains("Unable to open disk image '" + text + "'")) << run.log().toStdString();
    EXPECT_FALSE(run.log().contains("Disk Image has been opened successfully."));
}
