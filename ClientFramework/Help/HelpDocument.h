// The application's help: one HTML guide compiled into the program (":/help/guide.html") with a
// section per topic, and its contents page. "Help" shows the guide, "Help Contents" the list of its
// sections; both open in the help pop-up of the dialog seam, so they work without a network or a
// desktop browser.
#pragma once

#include <QList>
#include <QPair>
#include <QString>

namespace Core {
class Commander;
}

namespace Framework::Help {

inline const QString GuideResource = QStringLiteral(":/help/guide.html");
inline const QString GuideUrl = QStringLiteral("qrc:/help/guide.html");

// The guide's HTML ("" when the resource is missing).
QString guide();
// The sections of the guide in order: anchor id and heading text (from its <h2 id="..."> headings).
QList<QPair<QString, QString>> sections(const QString &html);
// The contents page: one link per section into the guide.
QString contents();
// The footer line under both pages.
QString footer();

void showGuide();
void showContents();

// Connects cmdHelp and cmdHelpContents.
void installCommands(Core::Commander &commander);

} // namespace Framework::Help
