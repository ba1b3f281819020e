// The SOURCE argument of the commands: a device path, a device number in kernel order, or an image
// file, resolved to a device of the kernel root.
#pragma once

#include <QString>

class CDevice;
class CRoot;

namespace Cli {

// Opens an image file as a device of the root (added to its list, so the root owns it). Returns
// null with an error text when the file is not an image it can open.
using ImageOpener = CDevice *(*)(CRoot &root, const QString &path, QString &error);

// Registers the opener that resolveSource tries for paths that name no device. The image commands
// register theirs from a static initializer of a file the command table references.
void registerImageOpener(ImageOpener opener);
ImageOpener imageOpener();

// Resolves SOURCE to a device of the root:
// - "disk:N": the device at index N of the kernel's device list (enumerated first when the root
//   has not enumerated yet);
// - a device path: "/dev/sdb", a link to one ("/dev/disk/by-id/..."), "\\.\PhysicalDriveN",
//   "\\.\CDRomN" or "\\.\X:" - the listed device, else the device is identified and added;
// - anything else: an image file, through the registered opener.
// Null with an error text when nothing matches.
CDevice *resolveSource(CRoot &root, const QString &source, QString &error);

} // namespace Cli
