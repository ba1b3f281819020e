#include "hexeditor/Commander.h"

#include "hexeditor/EditorCtrl.h"
#include "hexeditor/HexEditorSheet.h"
#include "hexeditor/Storage.h"
#include "hexeditor/StorageFactory.h"
#include "hexeditor/View.h"
#include "hexeditor/ViewResources.h"
#include "hexeditor/templates/TemplateType.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/GenericError.h"
#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodePartition.h"
#include "ClientFramework/Views/WindowManager.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"

#include <QAction>
#include <QCoreApplication>
#include <QFileDialog>

namespace HexEditor {

namespace {

// The volume node a file or folder node lives on.
NodeDrive *driveOf(NodeCore *node)
{
    for (NodeCore *n = node ? node->parent() : nullptr; n; n = n->parent())
        if (auto *drive = dynamic_cast<NodeDrive *>(n))
            return drive;
    return nullptr;
}

} // namespace

Commander::Commander(QObject *parent) : QObject(parent)
{
    initViewResources();
    connect(this, qOverload<NodeCore *>(&Commander::openInHexEditor), this,
            [this](NodeCore *node) { open(node); });
    connect(this, qOverload<NodeCore *, quint64, bool, int, quint64>(&Commander::openInHexEditor), this,
            [this](NodeCore *node, quint64 offset, bool readOnly, int type, quint64 offsetTmpl) {
                open(node, offset, readOnly, type, offsetTmpl);
            });
}

Commander::~Commander()
{
    for (const QPointer<View> &view : std::as_const(m_views))
        if (view && !view->parent())
            delete view.data();
}

const QList<Core::CommandRecord> &Commander::commands()
{
    static const QList<Core::CommandRecord> records = {
        {NodeOpen, QStringLiteral(":/hexeditor/edit"), QStringLiteral(":/hexeditor/32/edit"),
         QStringLiteral(":/hexeditor/48/edit"), QStringLiteral("Ctrl+H"), QStringLiteral("Edit"),
         QStringLiteral("Open selected item(s) in %1.")},
        {FileRecord, QStringLiteral(":/hexeditor/record"), QString(), QString(),
         QStringLiteral("Ctrl+Shift+H"), QStringLiteral("Inspect File Record"),
         QStringLiteral("Open file table record of selected item in Brindle.")},
    };
    return records;
}

void Commander::registerCommands(Core::Commander &registry)
{
    m_registry = &registry;
    for (const Core::CommandRecord &record : commands()) {
        registry.registerCommand(record);
        const QString id = record.id;
        registry.setHandler(id, [this, id] {
            if (m_registry)
                execute(id, m_registry->selection());
        });
    }
    // "Open File..." is the product's record; the hex editor carries it out.
    if (registry.isRegistered(FileOpen))
        registry.setHandler(FileOpen, [this] { onOpenFileCommand(); });
}

void Commander::registerViews(Framework::WindowManager &windows)
{
    m_windows = &windows;
}

bool Commander::execute(const QString &id, const QList<NodeCore *> &nodes)
{
    if (id == NodeOpen) {
        for (NodeCore *node : nodes)
            emit openInHexEditor(node);
        return true;
    }
    if (id == FileRecord) {
        if (!nodes.isEmpty())
            openFileRecord(nodes.constFirst());
        return true;
    }
    if (id == FileOpen) {
        onOpenFileCommand();
        return true;
    }
    return false;
}

void Commander::updateCommands(const QList<NodeCore *> &selection)
{
    if (!m_registry)
        return;
    bool any = false;
    for (NodeCore *node : selection)
        any = any || canOpen(node);
    if (QAction *a = m_registry->action(NodeOpen))
        a->setEnabled(any);
    bool record = false;
    if (selection.size() == 1) {
        const NodeKind kind = selection.constFirst()->kind();
        record = (kind == NodeKind::File || kind == NodeKind::Folder) && driveOf(selection.constFirst());
    }
    if (QAction *a = m_registry->action(FileRecord))
        a->setEnabled(record);
}

bool Commander::canOpen(NodeCore *node)
{
    auto *kernel = dynamic_cast<IKernelStorage *>(node);
    if (!kernel || !kernel->kernelStorage())
        return false;
    if (auto *partition = dynamic_cast<NodePartition *>(node); partition && partition->isUnallocated())
        return false;
    return true;
}

int Commander::recordTemplate(uint32_t kind)
{
    switch (kind) {
    case 7:
    case 8:
        return Templates::FatDirectoryEntry;
    case 9:
        return Templates::ExFatDirectoryEntry;
    case 10:
        return Templates::NtfsMftFileRecord;
    case 13:
        return Templates::HfsPlusFileRecord;
    case 14:
    case 15:
    case 16:
        return Templates::ExtInode;
    case 17:
        return Templates::UfsInode;
    default:
        return Templates::None;
    }
}

View *Commander::host(View *view, uint64_t offset, int type, uint64_t offsetTmpl)
{
    m_views.append(view);
    connect(view, &View::openInHexEditor, this, [this](NodeCore *node) { emit openInHexEditor(node); });
    if (m_host)
        m_host(view);
    else if (m_windows)
        m_windows->addView(view);
    // Listeners (the template pane among them) are connected before the request is applied.
    emit viewOpened(view);
    view->applyRequest(offset, type, offsetTmpl);
    return view;
}

View *Commander::open(NodeCore *node, uint64_t offset, bool readOnly, int type, uint64_t offsetTmpl)
{
    if (!node)
        return nullptr;
    QString error;
    std::unique_ptr<Storage> storage = canOpen(node) ? View::storageFor(node, error) : nullptr;
    if (!storage) {
        GenericError(error.isEmpty()
                         ? tr("%1 cannot be opened in the hex editor.").arg(node->text(NodeAttr::Name))
                         : error,
                     GenericError::Warning)
            .report();
        return nullptr;
    }
    return host(new View(node, std::move(storage), readOnly), offset, type, offsetTmpl);
}

View *Commander::openFile(const QString &path, uint64_t offset, bool readOnly, int type, uint64_t offsetTmpl)
{
    QString error;
    std::unique_ptr<Storage> storage = createPlainFileStorage(path, m_root, error);
    if (!storage) {
        GenericError(tr("Unable to open file '%1': %2").arg(path, error), GenericError::Warning).report();
        return nullptr;
    }
    return host(new View(nullptr, std::move(storage), readOnly), offset, type, offsetTmpl);
}

View *Commander::openFileRecord(NodeCore *node)
{
    auto *kernel = dynamic_cast<IKernelStorage *>(node);
    CEntry *entry = kernel ? kernel->kernelEntry() : nullptr;
    NodeDrive *drive = driveOf(node);
    CVolume *volume = drive ? drive->volume() : nullptr;
    if (!entry || !volume) {
        GenericError(
            tr("The file record of %1 cannot be found.").arg(node ? node->text(NodeAttr::Name) : QString()),
            GenericError::Warning)
            .report();
        return nullptr;
    }
    uint64_t position = entry->GetPosition();
    if (entry->GetAttributes() & CEntry::AttrSectorPosition)
        position *= volume->GetBytesPerSector();
    View *view = open(drive, position);
    if (view) {
        const int type = recordTemplate(volume->GetKind());
        if (type != Templates::None)
            view->requestTemplate(position, type);
    }
    return view;
}

void Commander::onOpenFileCommand()
{
    const QString path =
        m_fileName ? m_fileName()
                   : QFileDialog::getOpenFileName(nullptr, tr("Open File"), QString(), tr("All Files (*)"));
    if (!path.isEmpty())
        openFile(path);
}

QList<Framework::IPreferencePage *> Commander::createPreferencePages()
{
    auto *sheet = new HexEditorSheet;
    QPointer<Commander> self(this);
    sheet->setApplier([self](const HexEditorSheet::Values &values) {
        if (!self)
            return;
        for (View *view : self->views()) {
            HexEditorSheet::applyTo(view->editor(), values);
            view->onEditorStateChanged(view->editor()->hexOffset(), view->editor()->isReadOnly(),
                                       view->editor()->isBigEndian());
        }
    });
    return {sheet};
}

QList<View *> Commander::views() const
{
    QList<View *> result;
    for (const QPointer<View> &view : m_views)
        if (view)
            result.append(view.data());
    return result;
}

} // namespace HexEditor
