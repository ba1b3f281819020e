#include "ClientFramework/Preferences/LogSheet.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Settings/PathMacros.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QApplication>
#include <QCheckBox>
#include <QFormLayout>
#include <QLabel>
#include <QLineEdit>
#include <QStyle>

namespace Framework {

namespace {

constexpr uint32_t PageOptions =
    ApplicationLog::DetailMaximum | ApplicationLog::CreateNew | ApplicationLog::UseNamePattern;

class FrameworkPages : public IPreferencePageSource
{
public:
    QList<IPreferencePage *> createPreferencePages() override { return {new LogSheet}; }
};

} // namespace

LogSheet::LogSheet(std::function<QDomElement()> element, std::function<void(const QDomElement &)> apply,
                   QWidget *parent)
    : PreferenceSheet(
          ObjectName,
          element ? std::move(element) : [] { return SettingsDocument::instance().element(SettingsElement); },
          parent),
      m_apply(std::move(apply)), m_detail(new QCheckBox(tr("&Write hidden entries to the log file"), this)),
      m_createNew(new QCheckBox(tr("Start a &new log file at every start"), this)),
      m_usePattern(new QCheckBox(tr("Name the log file after the &date and time"), this)),
      m_folder(new QLineEdit(this)), m_file(new QLineEdit(this)), m_pattern(new QLineEdit(this))
{
    if (!m_apply)
        m_apply = [](const QDomElement &e) { ApplicationLog::instance().load(e); };
    m_detail->setObjectName(QStringLiteral("logDetail"));
    m_createNew->setObjectName(QStringLiteral("logCreateNew"));
    m_usePattern->setObjectName(QStringLiteral("logUsePattern"));
    m_folder->setObjectName(QStringLiteral("logFolder"));
    m_file->setObjectName(QStringLiteral("logFile"));
    m_pattern->setObjectName(QStringLiteral("logPattern"));
    m_folder->setToolTip(tr("%APPDATA%, %USER%, %TEMP%, %APP% and %CURRENT% stand for their folders"));
    m_pattern->setToolTip(tr("{Date(YYYY-MM-DD)} and {Time(HHmmss)} are replaced when the file is made"));

    form()->addRow(m_detail);
    form()->addRow(m_createNew);
    form()->addRow(tr("&Folder:"), m_folder);
    form()->addRow(tr("File na&me:"), m_file);
    form()->addRow(m_usePattern);
    form()->addRow(tr("&Pattern:"), m_pattern);
    auto *note = new QLabel(tr("The folder, the name and a new file take effect at the next start."), this);
    note->setWordWrap(true);
    addBelowForm(note);
    connect(m_usePattern, &QCheckBox::toggled, this, &LogSheet::updateEnabled);
    restoreDefaults();
}

QString LogSheet::pageTitle() const
{
    return tr("Application Log");
}

QString LogSheet::pageDescription() const
{
    return tr("Where %1 keeps the record of what it did").arg(Identity::ShortName);
}

QIcon LogSheet::pageIcon() const
{
    return QApplication::style()->standardIcon(QStyle::SP_FileDialogDetailedView);
}

void LogSheet::updateEnabled()
{
    m_file->setEnabled(!m_usePattern->isChecked());
    m_pattern->setEnabled(m_usePattern->isChecked());
}

void LogSheet::loadSettings()
{
    const QDomElement e = settings();
    bool ok = false;
    const uint32_t attr = e.attribute(QStringLiteral("attr")).toUInt(&ok);
    m_storedOptions = ok ? attr : ApplicationLog::DefaultOptions;
    m_detail->setChecked(m_storedOptions & ApplicationLog::DetailMaximum);
    m_createNew->setChecked(m_storedOptions & ApplicationLog::CreateNew);
    m_usePattern->setChecked(m_storedOptions & ApplicationLog::UseNamePattern);
    m_folder->setText(e.attribute(QStringLiteral("path"), PathMacros::DefaultLogFolder));
    m_file->setText(e.attribute(QStringLiteral("file"), Identity::LogFileName));
    m_pattern->setText(e.attribute(QStringLiteral("pattern"), ApplicationLog::DefaultPattern));
    updateEnabled();
}

void LogSheet::saveSettings()
{
    QDomElement e = settings();
    if (e.isNull())
        return;
    uint32_t options = m_storedOptions & ~PageOptions;
    if (m_detail->isChecked())
        options |= ApplicationLog::DetailMaximum;
    if (m_createNew->isChecked())
        options |= ApplicationLog::CreateNew;
    if (m_usePattern->isChecked())
        options |= ApplicationLog::UseNamePattern;
    // Empty fields would leave the log without a file: they keep their defaults.
    const QString folder = m_folder->text().trimmed();
    const QString file = m_file->text().trimmed();
    const QString pattern = m_pattern->text().trimmed();
    e.setAttribute(QStringLiteral("attr"), options);
    e.setAttribute(QStringLiteral("path"), folder.isEmpty() ? PathMacros::DefaultLogFolder : folder);
    e.setAttribute(QStringLiteral("file"), file.isEmpty() ? Identity::LogFileName : file);
    e.setAttribute(QStringLiteral("pattern"), pattern.isEmpty() ? ApplicationLog::DefaultPattern : pattern);
    m_storedOptions = options;
    if (m_apply)
        m_apply(e);
}

void LogSheet::restoreDefaults()
{
    m_detail->setChecked(ApplicationLog::DefaultOptions & ApplicationLog::DetailMaximum);
    m_createNew->setChecked(ApplicationLog::DefaultOptions & ApplicationLog::CreateNew);
    m_usePattern->setChecked(ApplicationLog::DefaultOptions & ApplicationLog::UseNamePattern);
    m_folder->setText(PathMacros::DefaultLogFolder);
    m_file->setText(Identity::LogFileName);
    m_pattern->setText(ApplicationLog::DefaultPattern);
    updateEnabled();
}

IPreferencePageSource &frameworkPreferencePages()
{
    static FrameworkPages pages;
    return pages;
}

} // namespace Framework
