// The hex editor's page of the preferences dialog ("prefHexEditor"): offsets, scrolling, the ASCII
// and Unicode columns, bytes per line and the font. It reads and writes the editor settings (the
// "hex-editor" element with its "font" and "viewport" children below the view's "view-hexeditor"
// element of "views"), and saving applies the values to every open hex editor.
#pragma once

#include "ClientFramework/Preferences/PreferenceSheet.h"

#include <cstdint>
#include <functional>

class QCheckBox;
class QComboBox;
class QSpinBox;

namespace HexEditor {

class EditorCtrl;

class HexEditorSheet : public Framework::PreferenceSheet
{
    Q_OBJECT
public:
    static inline const QString ObjectName = QStringLiteral("prefHexEditor");
    static inline const QString IconPath = QStringLiteral(":/hexeditor/32/default");

    // What the page edits.
    struct Values
    {
        QString fontName;
        int fontSize = 11;
        bool hexOffset = false;
        int wheelLines = 3;
        int pages = 1;
        uint32_t columns = 11; // the stored mask; the page changes bits 2 (ASCII) and 4 (Unicode)
        uint32_t bytesPerLine = 16;
    };

    // element: where the settings live (the settings document's "hex-editor" element of the hex
    // editor view by default).
    explicit HexEditorSheet(std::function<QDomElement()> element = {}, QWidget *parent = nullptr);

    // The settings element of the hex editor view in the settings document (created when missing).
    static QDomElement settingsElement();
    // The families offered: the installed fixed-pitch families, with the editor's default family.
    static QStringList fontFamilies();
    static Values defaults();

    // Called after saving with the values written (applies them to the open editors).
    void setApplier(std::function<void(const Values &)> applier) { m_applier = std::move(applier); }
    // Puts the page's values into an editor control (the other settings of the control are kept).
    static void applyTo(EditorCtrl *editor, const Values &values);

    // The values of the fields now.
    Values values() const;

    // Framework::IPreferencePage
    QString pageTitle() const override;
    QString pageDescription() const override;
    QIcon pageIcon() const override;
    void loadSettings() override;
    void saveSettings() override;
    void restoreDefaults() override;

    QCheckBox *hexOffsetBox() const { return m_hexOffset; }
    QSpinBox *wheelField() const { return m_wheel; }
    QSpinBox *pagesField() const { return m_pages; }
    QCheckBox *asciiBox() const { return m_ascii; }
    QCheckBox *unicodeBox() const { return m_unicode; }
    QComboBox *bytesPerLineList() const { return m_bytes; }
    QComboBox *fontNameList() const { return m_fontName; }
    QComboBox *fontSizeList() const { return m_fontSize; }

private:
    void showValues(const Values &values);

    std::function<void(const Values &)> m_applier;
    uint32_t m_storedColumns = 11;
    QCheckBox *m_hexOffset;
    QSpinBox *m_wheel;
    QSpinBox *m_pages;
    QCheckBox *m_ascii;
    QCheckBox *m_unicode;
    QComboBox *m_bytes;
    QComboBox *m_fontName;
    QComboBox *m_fontSize;
};

} // namespace HexEditor
