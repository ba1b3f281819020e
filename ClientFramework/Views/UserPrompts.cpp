#include "ClientFramework/Views/UserPrompts.h"

#include <QDesktopServices>
#include <QFileDialog>
#include <QUrl>

namespace Framework {

namespace {

class WidgetPrompts : public UserPrompts
{
public:
    QString openFileName(QWidget *parent, const QString &title, const QString &folder,
                         const QString &filter) override
    {
        return QFileDialog::getOpenFileName(parent, title, folder, filter);
    }
    QString saveFileName(QWidget *parent, const QString &title, const QString &suggested,
                         const QString &filter) override
    {
        return QFileDialog::getSaveFileName(parent, title, suggested, filter);
    }
    bool openUrl(const QString &url) override { return QDesktopServices::openUrl(QUrl(url)); }
};

WidgetPrompts widgetPrompts;
UserPrompts *installed = nullptr;

} // namespace

UserPrompts &UserPrompts::current()
{
    return installed ? *installed : widgetPrompts;
}

UserPrompts *UserPrompts::install(UserPrompts *prompts)
{
    UserPrompts *previous = installed;
    installed = prompts;
    return previous;
}

} // namespace Framework
