// A shown editor control over an in-memory disk, with recorded dialogs.
#pragma once

#include <QKeyEvent>
#include <QSignalSpy>
#include <QTest>
#include <gtest/gtest.h>

#include <memory>

#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/hexeditor/EditorCtrlFakeDisk.h"

class EditorCtrlFixture : public ::testing::Test
{
protected:
    void open(std::uint64_t size = 64 * 1024, std::uint32_t sectorSize = 512, bool readOnly = false)
    {
        ctrl.reset();
        storage.reset();
        disk = std::make_unique<EditorCtrlFakeDisk>(size, sectorSize);
        disk->fillPattern(std::min<std::uint64_t>(size, 64 * 1024));
        storage = std::make_unique<HexEditor::Storage>(disk.get());
        ctrl = std::make_unique<HexEditor::EditorCtrl>(storage.get(), readOnly);
        ctrl->resize(900, 600);
        ctrl->show();
        ASSERT_TRUE(QTest::qWaitForWindowExposed(ctrl.get()));
    }
    void SetUp() override { open(); }
    void TearDown() override
    {
        ctrl.reset();
        storage.reset();
        disk.reset();
    }

    void key(Qt::Key k, Qt::KeyboardModifiers mods = Qt::NoModifier) { QTest::keyClick(ctrl.get(), k, mods); }
    void type(const QString &text) { QTest::keyClicks(ctrl.get(), text); }
    // A character without a key of its own (sent with its text only).
    void typeChar(QChar ch)
    {
        QKeyEvent press(QEvent::KeyPress, Qt::Key_unknown, Qt::NoModifier, QString(ch));
        QCoreApplication::sendEvent(ctrl.get(), &press);
    }
    // Changes the disk behind the storage's back and drops what the storage cached.
    void poke(std::uint64_t offset, const QByteArray &bytes)
    {
        disk->setBytes(offset, bytes);
        storage->clearCache();
    }
    // The centre of a byte's cell (high nibble in the hexadecimal pane) in viewport coordinates.
    QPoint cellPoint(std::uint64_t offset, HexEditor::Metrics::Pane pane = HexEditor::Metrics::PaneHex,
                     int nibble = 0)
    {
        const std::uint32_t bpl = ctrl->bytesPerLine();
        const int x = ctrl->byteX(pane, std::uint32_t(offset % bpl), nibble) + ctrl->cellWidth() / 2;
        const int y = ctrl->lineY(offset / bpl) + ctrl->rowHeight() / 2;
        return {x, y};
    }
    std::uint8_t byteAt(std::uint64_t offset) { return std::uint8_t(storage->read({offset, 1}, true).at(0)); }

    RecordingDialogs dialogs;
    std::unique_ptr<EditorCtrlFakeDisk> disk;
    std::unique_ptr<HexEditor::Storage> storage;
    std::unique_ptr<HexEditor::EditorCtrl> ctrl;
};
