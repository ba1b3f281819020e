// The editor commands of a hex editor view (Back, Go to..., Save, Allow Edit, Undo, clipboard,
// block marks, bookmarks, find): one table of texts, shortcuts, tips and icons, and the QActions
// built from it for one view.
#pragma once

#include <QHash>
#include <QKeySequence>
#include <QList>
#include <QObject>
#include <QString>

class QAction;

namespace HexEditor {

struct EditorCommand
{
    QString key; // the action's object name ("actBack", ...)
    const char *text;
    QList<QKeySequence> shortcuts;
    const char *tip; // nullptr: none
    QString icon;    // empty: none; a "/32/" variant is used for 32x32 when present
    bool checkable = false;
};

class ViewActions : public QObject
{
    Q_OBJECT
public:
    // Action keys.
    static inline const QString Back = QStringLiteral("actBack");
    static inline const QString Forward = QStringLiteral("actForward");
    static inline const QString GotoOffset = QStringLiteral("actGotoOffset");
    static inline const QString GotoSector = QStringLiteral("actGotoSector");
    static inline const QString Save = QStringLiteral("actSave");
    static inline const QString AllowEdit = QStringLiteral("actAllowEdit");
    static inline const QString Undo = QStringLiteral("actUndo");
    static inline const QString Redo = QStringLiteral("actRedo");
    static inline const QString Revert = QStringLiteral("actRevert");
    static inline const QString FillBlock = QStringLiteral("actFillBlock");
    static inline const QString Paste = QStringLiteral("actPaste");
    static inline const QString TemplatePosition = QStringLiteral("actTemplatePosition");
    static inline const QString TemplateCopyPosition = QStringLiteral("actTemplateCopyPosition");
    static inline const QString BlockBegin = QStringLiteral("actBlockBegin");
    static inline const QString BlockEnd = QStringLiteral("actBlockEnd");
    static inline const QString SaveSelection = QStringLiteral("actSaveSelection");
    static inline const QString InsertFromFile = QStringLiteral("actInsertFromFile");
    static inline const QString SelectAll = QStringLiteral("actSelectAll");
    static inline const QString ClearSelection = QStringLiteral("actClearSelection");
    static inline const QString Copy = QStringLiteral("actCopy");
    static inline const QString CopyFormatted = QStringLiteral("actCopyFormatted");
    static inline const QString ToggleBookmark = QStringLiteral("actToggleBookmark");
    static inline const QString NextBookmark = QStringLiteral("actNextBookmark");
    static inline const QString PreviousBookmark = QStringLiteral("actPreviousBookmark");
    static inline const QString Find = QStringLiteral("actFind");
    static inline const QString FindPrevious = QStringLiteral("actFindPrevious");
    static inline const QString FindNext = QStringLiteral("actFindNext");

    // The command table, in menu order.
    static const QList<EditorCommand> &table();
    // An icon of a resource path with its "/32/" variant, when the resources hold them.
    static QIcon icon(const QString &path);

    explicit ViewActions(QObject *parent = nullptr);

    QAction *action(const QString &key) const { return m_actions.value(key); }
    QList<QAction *> actions() const;

private:
    QHash<QString, QAction *> m_actions;
    QList<QAction *> m_ordered;
};

} // namespace HexEditor
