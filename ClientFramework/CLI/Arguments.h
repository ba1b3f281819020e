// The framework half of the command line: the parser with the framework's options, the argument list,
// the first error, and the helpers that read option values.
#pragma once

#include "ClientFramework/Settings/PersistenceXML.h"

#include <QCommandLineParser>
#include <QStringList>

#include <cstdint>

namespace Framework::CLI {

class Arguments : public IPersistenceXML
{
public:
    // Takes every process argument, the program path first. A derived class that adds options passes
    // complete = false and calls complete() once its options are in.
    explicit Arguments(const QStringList &arguments, bool complete = true);
    Arguments(const Arguments &) = delete;
    Arguments &operator=(const Arguments &) = delete;

    // Saves the options given on the command line into the settings document's root.
    virtual void save();
    // IPersistenceXML: saves into the given root element; with flush the settings file is written.
    void save(QDomElement &root, bool flush = false) override;
    // Loads from the settings root (the command line stores nothing to load).
    virtual void load();
    void load(const QDomElement &element) override;
    virtual void reserved() {}
    ~Arguments() override;

    // Parses the argument list and checks the values; the first failure's text becomes
    // commandLineError. Returns true when the command line is sound.
    virtual bool parseAndValidate();
    virtual void showHelp();
    virtual void showVersion();
    // True when the command line asks for something to be done at start-up.
    virtual bool hasRequest() const;

    // The one argument object of the process (nullptr before it is made and after it is gone).
    static Arguments *instance();

    // Reading helpers; all return the default when there is no argument object or the option is absent.
    static bool isOptionSet(const QString &name);
    static bool flagValue(const QString &name, bool defaultValue);
    static int intValue(const QString &name, int defaultValue);
    static uint64_t offsetValue(const QString &name, uint64_t defaultValue);

    QCommandLineParser parser;
    QStringList arguments;
    QString commandLineError;

protected:
    // Puts "-" in front of every argument after the program path that lacks it, then parses and
    // checks when there is anything to parse.
    void complete();
    void addOption(const QStringList &names, const QString &description, const QString &valueName = {},
                   const QString &defaultValue = {});

    // The reading helpers of this object.
    bool isSet(const QString &name) const;
    bool flag(const QString &name, bool defaultValue) const;
    int integer(const QString &name, int defaultValue) const;
    uint64_t offset(const QString &name, uint64_t defaultValue) const;

private:
    QList<QCommandLineOption> m_options;
    bool m_parsed = false;
};

} // namespace Framework::CLI
