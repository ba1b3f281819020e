// The arguments of one sub-command: one source (the word that does not begin with "--"), switches,
// and options followed by a value. The arguments are read left to right; the first wrong one ends
// the reading with its problem as the usage line shows it.
#pragma once

#include <QList>
#include <QString>
#include <QStringList>

#include <cstdint>
#include <functional>

namespace Cli {

class OptionReader
{
public:
    // A switch without a value.
    void flag(const QString &name, std::function<void()> set);
    void flag(const QString &name, bool &on);
    // An option with a value; `take` refuses a value by returning false, which is reported with
    // `invalid` ("%1" stands for the value).
    void value(const QString &name, std::function<bool(const QString &)> take, const QString &invalid = {});
    void text(const QString &name, QString &target, bool &given);
    // A decimal or 0x-prefixed hexadecimal number.
    void number(const QString &name, std::uint64_t &target, bool &given, const QString &invalid);

    // False with the problem at the first argument that is not understood, lacks its value, or is a
    // second source. A missing source is the caller's to report (`source` stays empty).
    bool read(const QStringList &args, QString &source, QString &problem) const;

private:
    struct Option
    {
        QString name;
        bool takesValue = false;
        std::function<bool(const QString &)> take;
        QString invalid;
    };
    QList<Option> m_options;
};

} // namespace Cli
