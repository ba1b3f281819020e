// Process-wide identity of the application, set before anything else runs.
#pragma once

#include <QString>
#include <QStringList>

namespace Framework::Identity {

inline const QString FullName = QStringLiteral("Orvane Brindle");
inline const QString ShortName = QStringLiteral("Brindle");
inline const QString OrganizationName = QStringLiteral("Orvane");
inline const QString PlatformSuffix = QStringLiteral(" x64");
inline const QString Version = QStringLiteral("24.0");
inline const QString FileVersion = QStringLiteral("24.0.25");
inline const QStringList IconFolders = {QStringLiteral(":/ico"), QStringLiteral(":/24/ico"),
                                        QStringLiteral(":/32/ico"), QStringLiteral(":/48/ico")};
inline const QString LogoImage = QStringLiteral(":/logo");
inline const QString SplashImage = QStringLiteral(":/splash/default");
inline const QString LeadImage = QStringLiteral(":/lead");
inline const QString AsideImage = QStringLiteral(":/aside");
inline const QString CliHelpPage = QStringLiteral("qrc:/docs/cli");
inline const QString SettingsFileName = QStringLiteral("settings-brindle.xml");
inline const QString LogFileName = QStringLiteral("brindle.log");
inline const QString HardwareInfoFileName = QStringLiteral("hddinfo.xml");
inline const QString SettingsKeyWord = QStringLiteral("Brindle");

} // namespace Framework::Identity
