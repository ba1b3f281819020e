// The product's command line: the framework options plus the options that name what to open.
#pragma once

#include "ClientFramework/CLI/Arguments.h"

namespace CLI {

class Arguments : public Framework::CLI::Arguments
{
public:
    explicit Arguments(const QStringList &arguments);

    void save(QDomElement &root, bool flush = false) override;
    using Framework::CLI::Arguments::save;
    void showHelp() override;
    bool hasRequest() const override;

    // The help page with its placeholders filled in (the executable's file name is the first argument's).
    QString helpPage() const;
    QString helpFooter() const;
    // The table of template ids and names that replaces "@@TEMPLATE-TYPES@@".
    static QString templateTable();
};

} // namespace CLI
