// Process-wide identity of the application, set before anything else runs.
#pragma once

#include <QString>

namespace Framework::Identity {

inline const QString FullName = QStringLiteral("Orvane Brindle");
inline const QString ShortName = QStringLiteral("Brindle");
inline const QString PlatformSuffix = QStringLiteral(" x64");
inline const QString Version = QStringLiteral("24.0");
inline const QString FileVersion = QStringLiteral("24.0.25");
inline const QString CliHelpPage = QStringLiteral("qrc:/docs/cli");
inline const QString SettingsFileName = QStringLiteral("settings-brindle.xml");
inline const QString LogFileName = QStringLiteral("brindle.log");
inline const QString HardwareInfoFileName = QStringLiteral("hddinfo.xml");
inline const QString SettingsKeyWord = QStringLiteral("Brindle");

} // namespace Framework::Identity
