// The preferences dialog behind "Preferences...": the list of pages on the left, the chosen page with
// its title and description on the right, and OK / Cancel / Apply / "Restore Defaults" below.
// OK and Apply write every page into the settings document and the settings file; Cancel writes
// nothing; "Restore Defaults" puts the defaults into the fields of the page shown.
#pragma once

#include "ClientFramework/Preferences/IPreferencePage.h"

#include <QDialog>
#include <QList>
#include <QSemaphore>

#include <functional>

class QDialogButtonBox;
class QLabel;
class QListWidget;
class QStackedWidget;

namespace Framework {

class PreferencesDlg : public QDialog
{
    Q_OBJECT
public:
    explicit PreferencesDlg(QWidget *parent = nullptr);
    ~PreferencesDlg() override;

    // Takes the page over (its widget becomes a child of the dialog) and loads its fields.
    void addPage(IPreferencePage *page);
    int pageCount() const { return int(m_pages.size()); }
    IPreferencePage *page(int index) const { return m_pages.value(index, nullptr); }
    // The page whose widget has this object name, or nullptr.
    IPreferencePage *page(const QString &objectName) const;
    int currentPage() const;
    void setCurrentPage(int index);

    // Writes every page into the settings document, then the settings file. False when another
    // apply is still running or the file could not be written.
    bool apply();
    // The defaults into the fields of the page shown.
    void restoreDefaults();

    QDialogButtonBox *buttons() const { return m_buttons; }
    QListWidget *pageList() const { return m_list; }
    QLabel *titleLabel() const { return m_title; }
    QLabel *descriptionLabel() const { return m_description; }

    // How the dialog is shown: modal exec() unless a runner is installed (tests answer it without
    // showing it). Returns the previous runner.
    using Runner = std::function<int(PreferencesDlg &dialog)>;
    static Runner setRunner(Runner runner);
    // Shows the dialog through the runner; QDialog's result.
    int run();

public slots:
    void accept() override;

private:
    void showPage(int index);

    QList<IPreferencePage *> m_pages;
    QListWidget *m_list;
    QStackedWidget *m_stack;
    QLabel *m_icon;
    QLabel *m_title;
    QLabel *m_description;
    QDialogButtonBox *m_buttons;
    QSemaphore m_applying{1};
};

} // namespace Framework
