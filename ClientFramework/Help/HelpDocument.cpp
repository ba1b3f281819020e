#include "ClientFramework/Help/HelpDocument.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/DialogSeam.h"

#include <QCoreApplication>
#include <QFile>
#include <QRegularExpression>
#include <QTextDocument>

// Q_INIT_RESOURCE must be used outside of any namespace.
static void initHelpResources()
{
    Q_INIT_RESOURCE(brindle_help);
}

namespace Framework::Help {

namespace {
QString tr(const char *text)
{
    return QCoreApplication::translate("Framework::Help", text);
}
} // namespace

QString guide()
{
    static const bool initialised = (initHelpResources(), true);
    Q_UNUSED(initialised);
    QFile file(GuideResource);
    if (!file.open(QIODevice::ReadOnly))
        return QString();
    return QString::fromUtf8(file.readAll());
}

QList<QPair<QString, QString>> sections(const QString &html)
{
    static const QRegularExpression heading(QStringLiteral("<h2\\s+id=\"([^\"]+)\"\\s*>(.*?)</h2>"),
                                            QRegularExpression::CaseInsensitiveOption |
                                                QRegularExpression::DotMatchesEverythingOption);
    QList<QPair<QString, QString>> result;
    for (auto it = heading.globalMatch(html); it.hasNext();) {
        const QRegularExpressionMatch m = it.next();
        QTextDocument text;
        text.setHtml(m.captured(2));
        result.append({m.captured(1), text.toPlainText().simplified()});
    }
    return result;
}

QString contents()
{
    QString html =
        QStringLiteral("<html><body><h1>%1</h1><ul>").arg(tr("%1 Help Contents").arg(Identity::ShortName));
    for (const auto &[id, title] : sections(guide()))
        html += QStringLiteral("<li><a href=\"%1#%2\">%3</a></li>")
                    .arg(GuideUrl, id.toHtmlEscaped(), title.toHtmlEscaped());
    html += QStringLiteral("</ul><p><a href=\"%1\">%2</a></p></body></html>")
                .arg(GuideUrl, tr("The whole guide"));
    return html;
}

QString footer()
{
    return tr("<b>%1</b> %2 (%3)").arg(Identity::FullName, Identity::Version, Identity::FileVersion);
}

void showGuide()
{
    DialogSeam::current().helpPopup(tr("%1 Help").arg(Identity::ShortName), guide(), footer());
}

void showContents()
{
    DialogSeam::current().helpPopup(tr("%1 Help Contents").arg(Identity::ShortName), contents(), footer());
}

void installCommands(Core::Commander &commander)
{
    commander.setHandler(QStringLiteral("cmdHelp"), &showGuide);
    commander.setHandler(QStringLiteral("cmdHelpContents"), &showContents);
}

} // namespace Framework::Help
