// The product's commands, registered after the framework's, and the icons of the commands on the
// main toolbar.
#pragma once

#include "ClientFramework/Commands/Commander.h"

namespace Solution {

class Commander : public Core::Commander
{
    Q_OBJECT
public:
    explicit Commander(QObject *parent = nullptr);

    static const QList<Core::CommandRecord> &productCommands();
    // The icon resource of a command: ":/app/<name>" (16 px) and ":/app/32/<name>" ("" for none).
    static QString iconName(const QString &id);
};

} // namespace Solution
