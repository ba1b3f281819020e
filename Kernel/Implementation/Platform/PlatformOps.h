// Free operations of the platform layer. Each takes the kernel root (may be null) for its failure record
// and its back end.
#pragma once

#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include <QString>
#include <QStringList>

#include <cstdint>

class cRoot;

// Long-path form of a path in the given conventions (see the definition for the rules).
QString NativePath(const QString &path, PathStyle style);
// Long-path form in the conventions of the default back end.
QString NativePath(const QString &path);

// Clears the attributes of a file, then deletes it; either failing sends record 27.
bool PlatformDeleteFile(cRoot *owner, const QString &name);
// Renames a file, replacing one of the new name; failure sends record 28.
bool PlatformMoveFile(cRoot *owner, const QString &from, const QString &to);

// Mounts a volume at the drive letter 'A' + index; fails without a call for an index of 26 or more.
bool AssignDriveLetter(cRoot *owner, const QString &volumeName, uint32_t letterIndex);
// Removes the mount point of the drive letter 'A' + index.
bool RemoveDriveLetter(cRoot *owner, uint32_t letterIndex);

// The whole text of a file of 1 to 65,535 bytes in the local 8-bit code page; nothing otherwise.
QString ReadTextFile(cRoot *owner, const QString &path);
// Writes the lines, each ended by "\r\n", in the local 8-bit code page, replacing the file.
bool WriteTextFile(cRoot *owner, const QString &path, const QStringList &lines);

// The pretty product name of the system ("Unknown Windows version" when its version is not known).
QString SystemVersionText(cRoot *owner);

// The system's text for a system error code, trimmed.
QString SystemErrorText(cRoot *owner, uint32_t code);

// Restarts the machine at once, forced. Never called by tests.
bool RestartMachine(cRoot *owner);
