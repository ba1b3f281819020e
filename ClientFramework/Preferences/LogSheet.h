// The framework's page of the preferences dialog ("prefLog"): the options of the application log in
// its "log" settings element. Whether hidden entries reach the file applies at once; the file's
// folder, name and the new-file switch apply from the next start.
#pragma once

#include "ClientFramework/Preferences/PreferenceSheet.h"

#include <cstdint>
#include <functional>

class QCheckBox;
class QLineEdit;

namespace Framework {

class LogSheet : public PreferenceSheet
{
    Q_OBJECT
public:
    static inline const QString ObjectName = QStringLiteral("prefLog");
    static inline const QString SettingsElement = QStringLiteral("log");

    // element: where the options live (the settings document's "log" element by default); apply:
    // what follows a save (the running log takes the options over by default).
    explicit LogSheet(std::function<QDomElement()> element = {},
                      std::function<void(const QDomElement &)> apply = {}, QWidget *parent = nullptr);

    QString pageTitle() const override;
    QString pageDescription() const override;
    QIcon pageIcon() const override;
    void loadSettings() override;
    void saveSettings() override;
    void restoreDefaults() override;

    QCheckBox *detailBox() const { return m_detail; }
    QCheckBox *createNewBox() const { return m_createNew; }
    QCheckBox *patternBox() const { return m_usePattern; }
    QLineEdit *folderField() const { return m_folder; }
    QLineEdit *fileField() const { return m_file; }
    QLineEdit *patternField() const { return m_pattern; }

private:
    void updateEnabled();

    std::function<void(const QDomElement &)> m_apply;
    uint32_t m_storedOptions = 0;
    QCheckBox *m_detail;
    QCheckBox *m_createNew;
    QCheckBox *m_usePattern;
    QLineEdit *m_folder;
    QLineEdit *m_file;
    QLineEdit *m_pattern;
};

// The pages every product of the framework has.
IPreferencePageSource &frameworkPreferencePages();

} // namespace Framework
