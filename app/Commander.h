// The product's commands, registered after the framework's.
#pragma once

#include "ClientFramework/Commands/Commander.h"

namespace Solution {

class Commander : public Core::Commander
{
    Q_OBJECT
public:
    explicit Commander(QObject *parent = nullptr);

    static const QList<Core::CommandRecord> &productCommands();
};

} // namespace Solution
