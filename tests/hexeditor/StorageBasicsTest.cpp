#include <gtest/gtest.h>

#include "hexeditor/Storage.h"

using HexEditor::DiskArea;
using HexEditor::Storage;

TEST(StorageBasics, StorageWithoutKernelObjectReadsNothingAndRefusesWrites)
{
    Storage storage(nullptr);
    int failures = 0;
    QObject::connect(&storage, &Storage::writeFailed, [&](const QString &text) {
        ++failures;
        EXPECT_TRUE(text.contains(QLatin1String("666"))) << text.toStdString();
    });
    EXPECT_TRUE(storage.read(DiskArea{0, 16}).isEmpty());
    EXPECT_EQ(storage.write(0, QByteArray(4, 'x')), 0u);
    EXPECT_EQ(failures, 1);
    EXPECT_FALSE(storage.isModified());
}
