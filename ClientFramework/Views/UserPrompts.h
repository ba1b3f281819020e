// File choosers and the web browser of the main window's commands go through this seam, so tests
// answer them instead of a person (they never block).
#pragma once

#include <QString>
#include <QStringList>

class QWidget;

namespace Framework {

class UserPrompts
{
public:
    virtual ~UserPrompts() = default;

    // The file chosen to open, or "" when cancelled.
    virtual QString openFileName(QWidget *parent, const QString &title, const QString &folder,
                                 const QString &filter) = 0;
    // The file chosen to write, or "" when cancelled.
    virtual QString saveFileName(QWidget *parent, const QString &title, const QString &suggested,
                                 const QString &filter) = 0;
    // Opens an address in the desktop's browser.
    virtual bool openUrl(const QString &url) = 0;

    // The seam in use: the widget implementation unless another was installed.
    static UserPrompts &current();
    // Installs another (not owned); nullptr restores the widget implementation. Returns the previous.
    static UserPrompts *install(UserPrompts *prompts);
};

// Records the requests and answers with scripted file names (tests).
class ScriptedPrompts : public UserPrompts
{
public:
    ScriptedPrompts() { m_previous = install(this); }
    ~ScriptedPrompts() override { install(m_previous); }

    QString openFileName(QWidget *, const QString &title, const QString &, const QString &) override
    {
        titles << title;
        return files.isEmpty() ? QString() : files.takeFirst();
    }
    QString saveFileName(QWidget *, const QString &title, const QString &, const QString &) override
    {
        titles << title;
        return files.isEmpty() ? QString() : files.takeFirst();
    }
    bool openUrl(const QString &url) override
    {
        urls << url;
        return true;
    }

    QStringList files; // answers, first used first
    QStringList titles;
    QStringList urls;

private:
    UserPrompts *m_previous = nullptr;
};

} // namespace Framework
