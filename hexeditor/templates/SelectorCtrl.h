// The template chooser: a combo box whose popup is a tree of template groups. It owns one model of
// every kind that has a template, created when a storage is attached.
#pragma once

#include <QComboBox>
#include <QList>
#include <QVariantList>

#include <memory>
#include <vector>

#include "hexeditor/templates/core/TemplateType.h"

class QStandardItemModel;
class QTreeView;

namespace HexEditor {
class Storage;
}

namespace HexEditor::Templates {

class Model;

class SelectorCtrl : public QComboBox
{
    Q_OBJECT
public:
    struct Template
    {
        Type id = None;
        QString name;
        Model *model = nullptr;
    };

    explicit SelectorCtrl(QWidget *parent = nullptr);
    ~SelectorCtrl() override;

    // Creates the models of every kind over the storage (null: only "No template").
    void setStorage(Storage *storage);
    const QList<Template> &templates() const { return m_templates; }
    Template current() const;
    Template find(int id) const;
    // Shows and selects the entry of that id and emits templateSelected; an id without an entry
    // changes nothing (false).
    bool selectTemplate(int id);

    void showPopup() override;
    void hidePopup() override;

signals:
    void templateSelected(const HexEditor::Templates::SelectorCtrl::Template &item);
    void templateModified(const QVariantList &changes);

private:
    void rebuildItems();
    void showEntry(int id);

    QStandardItemModel *m_items;
    QTreeView *m_tree;
    std::vector<std::unique_ptr<Model>> m_models;
    QList<Template> m_templates;
    int m_current = None;
};

} // namespace HexEditor::Templates

Q_DECLARE_METATYPE(HexEditor::Templates::SelectorCtrl::Template)
