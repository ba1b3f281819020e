#include "hexeditor/templates/Delegate.h"

#include <QLineEdit>
#include <QRegularExpressionValidator>

#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/Validators.h"
#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

QWidget *Delegate::createEditor(QWidget *parent, const QStyleOptionViewItem &, const QModelIndex &index) const
{
    auto *edit = new QLineEdit(parent);
    const auto format = FieldFormat(index.data(Model::FormatRole).toInt());
    const int size = index.data(Model::SizeRole).toInt();
    const std::uint32_t width = Values::numberWidth(format);
    if (width) {
        const std::uint64_t max = width >= 8 ? UINT64_MAX : (std::uint64_t(1) << (8 * width)) - 1;
        edit->setValidator(new HexUInt64Validator(0, max, edit));
    } else {
        switch (format) {
        case DosDate:
            edit->setInputMask(QStringLiteral("0000-00-00"));
            edit->setValidator(new HexDosTimeValidator(true, edit));
            break;
        case DosDateTime:
            edit->setInputMask(QStringLiteral("0000-00-00 00:00:00"));
            edit->setValidator(new HexDosTimeValidator(false, edit));
            break;
        case FileTime:
        case NtTime:
            edit->setInputMask(QStringLiteral("0000-00-00 00:00:00"));
            edit->setValidator(new HexWindowsTimeValidator(edit));
            break;
        case HfsTime:
            edit->setInputMask(QStringLiteral("0000-00-00 00:00:00"));
            edit->setValidator(new HexMacTimeValidator(edit));
            break;
        case UnixTime:
        case UnixNanoTime:
            edit->setInputMask(QStringLiteral("0000-00-00 00:00:00"));
            edit->setValidator(new HexUnixTimeValidator(edit));
            break;
        case Bit:
            edit->setValidator(
                new QRegularExpressionValidator(QRegularExpression(QStringLiteral("[01]{1,1}")), edit));
            break;
        case HexBytes:
            edit->setValidator(new HexPatternValidator(size, edit));
            break;
        case DosName:
            edit->setValidator(new HexDosFileNameValidator(size, edit));
            break;
        case LongName:
            edit->setValidator(new HexLongFileNameValidator(size / 2, edit));
            break;
        case ExFatName:
            edit->setValidator(new HexExFatFileNameValidator(size / 2, edit));
            break;
        case AnsiZeroPadded:
        case AnsiSpacePadded:
        case Utf8Text:
            edit->setMaxLength(size);
            break;
        case Utf16Fixed:
            edit->setMaxLength(size / 2);
            break;
        default:
            break;
        }
    }
    // Enter, Tab and leaving the field commit and close it (the delegate's event filter).
    return edit;
}

void Delegate::setEditorData(QWidget *editor, const QModelIndex &index) const
{
    auto *edit = qobject_cast<QLineEdit *>(editor);
    if (!edit)
        return;
    const QVariant v = index.data(Qt::EditRole);
    if (FieldFormat(index.data(Model::FormatRole).toInt()) == Bit)
        edit->setText(index.data(Qt::DisplayRole).toString() == QLatin1String("true") ? QStringLiteral("1")
                                                                                      : QStringLiteral("0"));
    else
        edit->setText(v.toString());
}

void Delegate::setModelData(QWidget *editor, QAbstractItemModel *model, const QModelIndex &index) const
{
    if (auto *edit = qobject_cast<QLineEdit *>(editor))
        commitText(model, index, edit->text());
}

bool Delegate::commitText(QAbstractItemModel *model, const QModelIndex &index, const QString &text)
{
    auto *m = qobject_cast<Model *>(model);
    if (!m)
        return false;
    const auto bytes = m->parseText(index, text);
    if (!bytes)
        return false;
    if (FieldFormat(index.data(Model::FormatRole).toInt()) == Bit) {
        const QModelIndex parent = index.parent();
        return m->setData(m->index(parent.row(), index.column(), parent.parent()), *bytes, Qt::EditRole);
    }
    return m->setData(index, *bytes, Qt::EditRole);
}

} // namespace HexEditor::Templates
