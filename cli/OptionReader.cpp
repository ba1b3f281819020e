#include "cli/OptionReader.h"

#include "cli/Number.h"

namespace Cli {

void OptionReader::flag(const QString &name, std::function<void()> set)
{
    m_options.append({name,
                      false,
                      [set = std::move(set)](const QString &) {
                          set();
                          return true;
                      },
                      {}});
}

void OptionReader::flag(const QString &name, bool &on)
{
    flag(name, [&on] { on = true; });
}

void OptionReader::value(const QString &name, std::function<bool(const QString &)> take,
                         const QString &invalid)
{
    m_options.append({name, true, std::move(take), invalid});
}

void OptionReader::text(const QString &name, QString &target, bool &given)
{
    value(name, [&target, &given](const QString &v) {
        target = v;
        given = true;
        return true;
    });
}

void OptionReader::number(const QString &name, std::uint64_t &target, bool &given, const QString &invalid)
{
    value(
        name,
        [&target, &given](const QString &v) {
            std::uint64_t n = 0;
            if (!parseNumber(v, n))
                return false;
            target = n;
            given = true;
            return true;
        },
        invalid);
}

bool OptionReader::read(const QStringList &args, QString &source, QString &problem) const
{
    for (qsizetype i = 0; i < args.size(); ++i) {
        const QString &a = args[i];
        const Option *option = nullptr;
        for (const Option &o : m_options) {
            if (o.name == a) {
                option = &o;
                break;
            }
        }
        if (option) {
            if (!option->takesValue) {
                option->take(QString());
                continue;
            }
            if (i + 1 >= args.size()) {
                problem = QStringLiteral("%1 needs a value").arg(a);
                return false;
            }
            const QString &v = args[++i];
            if (!option->take(v)) {
                problem = option->invalid.arg(v);
                return false;
            }
        } else if (a.startsWith(QLatin1String("--"))) {
            problem = QStringLiteral("unknown option '%1'").arg(a);
            return false;
        } else if (source.isEmpty()) {
            source = a;
        } else {
            problem = QStringLiteral("more than one source given");
            return false;
        }
    }
    return true;
}

} // namespace Cli
