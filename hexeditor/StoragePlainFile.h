// The storage of a plain file of the computer, read through the platform file in 512-byte
// sectors (the last one may be partial: it reads as zeros past the end, and writes never
// lengthen the file).
#pragma once

#include <memory>

#include "hexeditor/Storage.h"

class cRoot;

namespace HexEditor {

class PlainFileObject;

class StoragePlainFile : public Storage
{
    Q_OBJECT

public:
    // Opens the file read-only; isOpen() tells whether that worked.
    StoragePlainFile(const QString &path, cRoot *root, QObject *parent = nullptr);
    ~StoragePlainFile() override;

    bool isOpen() const;
    QString openError() const;
    bool isFileStorage() const override { return true; }

private:
    std::unique_ptr<PlainFileObject> m_object;
};

} // namespace HexEditor
