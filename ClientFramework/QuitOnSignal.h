// Ends the event loop in an orderly way on SIGTERM, SIGINT and SIGHUP (a session that ends, Ctrl+C), so
// the log gets its closing banner, the settings are saved and the instance segment is released.
#pragma once

#include <QObject>

class QSocketNotifier;

namespace Framework {

class QuitOnSignal : public QObject
{
public:
    explicit QuitOnSignal(QObject *parent = nullptr);
    ~QuitOnSignal() override;

private:
    QSocketNotifier *m_notifier = nullptr;
};

} // namespace Framework
