// Macros that paths stored in the settings may contain.
#pragma once

#include <QString>

namespace Framework::PathMacros {

// Replaces, case-sensitively and in this order, "%TEMP%" (the temporary folder), "%USER%" (the home
// folder), "%CURRENT%" (the current folder), "%APP%" (the running executable's folder) and
// "%APPDATA%" (the per-user data folder), then converts to native separators.
QString resolve(const QString &path);

// The folder of the running executable (also before the application object exists).
QString applicationFolder();
// The per-user writable data folder.
QString applicationDataFolder();

// The log file's folder when none is stored: the data folder, as the executable's folder of an
// installed program is not writable.
inline const QString DefaultLogFolder = QStringLiteral("%APPDATA%");

} // namespace Framework::PathMacros
