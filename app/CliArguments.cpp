#include "app/CliArguments.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/DialogSeam.h"
#include "hexeditor/templates/TemplateType.h"

#include <QCoreApplication>
#include <QFile>
#include <QFileInfo>
#include <QXmlStreamWriter>

// The help page is compiled into the application library.
static void initResources()
{
    Q_INIT_RESOURCE(brindle);
}

namespace CLI {

namespace {
QString tr(const char *text)
{
    return QCoreApplication::translate("CLI::Arguments", text);
}
} // namespace

Arguments::Arguments(const QStringList &args) : Framework::CLI::Arguments(args, false)
{
    addOption({QStringLiteral("d"), QStringLiteral("disk")}, tr("Physical disk BIOS number."),
              QStringLiteral("disk"));
    addOption({QStringLiteral("dp"), QStringLiteral("diskprefix")}, tr("Open a disk of given prefix."),
              QStringLiteral("diskprefix"));
    addOption({QStringLiteral("vo"), QStringLiteral("volumeoffset")}, tr("Volume offset."),
              QStringLiteral("volumeoffset"));
    addOption({QStringLiteral("f"), QStringLiteral("file")}, tr("File path to open by default."),
              QStringLiteral("file"));
    addOption({QStringLiteral("o"), QStringLiteral("offset")}, tr("Opened disk/partition/volume offset."),
              QStringLiteral("offset"));
    addOption({QStringLiteral("t"), QStringLiteral("template")}, tr("Service record template ID."),
              QStringLiteral("template"), QStringLiteral("auto"));
    addOption({QStringLiteral("to"), QStringLiteral("templateoffset")},
              tr("Offset of template within context disk."), QStringLiteral("templateoffset"));
    complete();
}

void Arguments::save(QDomElement &root, bool flush)
{
    Framework::CLI::Arguments::save(root, flush);
}

QString Arguments::templateTable()
{
    using HexEditor::Templates::typeName;
    QString html;
    QXmlStreamWriter xml(&html);
    xml.setAutoFormatting(true);
    xml.writeStartElement(QStringLiteral("table"));
    xml.writeAttribute(QStringLiteral("border"), QStringLiteral("0"));
    for (int i = 0; i < 17; ++i) {
        xml.writeStartElement(QStringLiteral("tr"));
        xml.writeTextElement(QStringLiteral("td"), QStringLiteral("%1 - %2").arg(i).arg(typeName(i)));
        xml.writeTextElement(QStringLiteral("td"),
                             QStringLiteral("%1 - %2").arg(i + 17).arg(typeName(i + 17)));
        xml.writeEndElement();
    }
    xml.writeEndElement();
    return html;
}

QString Arguments::helpPage() const
{
    initResources();
    QString page;
    QString path = Framework::Identity::CliHelpPage;
    path.replace(QStringLiteral("qrc:/"), QStringLiteral(":/"));
    QFile file(path);
    if (file.open(QIODevice::ReadOnly))
        page = QString::fromUtf8(file.readAll());
    const QString exe = QFileInfo(arguments.value(0)).fileName();
    page.replace(QStringLiteral("@@TEMPLATE-TYPES@@"), templateTable());
    page.replace(QStringLiteral("@@EXE-FILENAME@@"), exe);
    page.replace(QStringLiteral("@@APP-NAME@@"), Framework::Identity::FullName);
    for (int id = 0; id < HexEditor::Templates::TypeCount; ++id)
        page.replace(QStringLiteral("@@TEMPLATE-%1@@").arg(id), HexEditor::Templates::typeName(id));
    return page;
}

QString Arguments::helpFooter() const
{
    return tr("Use <b>%1 -help</b> or <b>%1 -?</b> to show this help pop-up")
        .arg(QFileInfo(arguments.value(0)).fileName());
}

void Arguments::showHelp()
{
    auto &seam = Framework::DialogSeam::current();
    seam.closeSplash();
    seam.helpPopup(tr("Command Line Interface"), helpPage(), helpFooter());
}

bool Arguments::hasRequest() const
{
    for (const char *name : {"test", "help", "version", "file", "disk", "mountdi"})
        if (isSet(QString::fromLatin1(name)))
            return true;
    return false;
}

} // namespace CLI
