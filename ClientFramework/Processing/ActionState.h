// A unit of work run by the application with a title and a result code; announces when it finishes.
#pragma once

#include <QObject>
#include <QString>

namespace Framework {

class ActionState : public QObject
{
    Q_OBJECT
public:
    explicit ActionState(const QString &title, QObject *parent = nullptr) : QObject(parent), m_title(title) {}

    QString title() const { return m_title; }
    bool isFinished() const { return m_finished; }
    bool isCancelled() const { return m_cancelled; }
    uint32_t resultCode() const { return m_result; }

    void cancel() { m_cancelled = true; }

signals:
    void finished(uint32_t resultCode);

protected:
    void finish(uint32_t resultCode)
    {
        m_finished = true;
        m_result = resultCode;
        emit finished(resultCode);
    }

private:
    QString m_title;
    bool m_finished = false;
    bool m_cancelled = false;
    uint32_t m_result = 0;
};

} // namespace Framework
