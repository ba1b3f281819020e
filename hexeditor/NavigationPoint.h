// One named on-disk structure of a storage (a partition table, a boot sector, a FAT copy, the
// MFT, a superblock) with the template that interprets it. The points form a tree: a point with
// children is a submenu titled by its title.
#pragma once

#include <QList>
#include <QString>

#include <cstdint>

#include "hexeditor/templates/TemplateType.h"

namespace HexEditor {

struct NavigationPoint
{
    enum Kind : std::uint32_t {
        Jump = 1,           // move there (and apply the template, if any)
        Separator = 2,      // a separator line
        AskMftRecord = 3,   // "MFT No..."
        AskCatalogNode = 4, // "Node No..."
    };

    QString title;
    std::uint64_t offset = 0;
    std::uint8_t primary = 1; // 0 for a structure's backup copy
    Templates::Type templateType = Templates::None;
    std::uint32_t kind = Jump;
    QList<NavigationPoint> children;

    static NavigationPoint jump(const QString &title, std::uint64_t offset,
                                Templates::Type type = Templates::None, bool primary = true)
    {
        NavigationPoint p;
        p.title = title;
        p.offset = offset;
        p.templateType = type;
        p.primary = primary ? 1 : 0;
        return p;
    }
    static NavigationPoint submenu(const QString &title, const QList<NavigationPoint> &children)
    {
        NavigationPoint p;
        p.title = title;
        p.children = children;
        return p;
    }
    static NavigationPoint ask(const QString &title, Kind kind)
    {
        NavigationPoint p;
        p.title = title;
        p.kind = kind;
        return p;
    }
};

} // namespace HexEditor
