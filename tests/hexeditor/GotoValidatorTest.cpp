// The number fields of the go-to dialogs: signs, "0x" values, grouping and ranges as typed.
#include "hexeditor/HexInt64Validator.h"

#include <QLocale>
#include <gtest/gtest.h>

using HexEditor::HexInt64Validator;

namespace {

struct Typed
{
    QValidator::State state;
    QString text;
    int pos;
};

Typed type(const HexInt64Validator &v, const QString &text, int pos = -1)
{
    QString t = text;
    int p = pos < 0 ? static_cast<int>(t.size()) : pos;
    const QValidator::State s = v.validate(t, p);
    return {s, t, p};
}

struct English : HexInt64Validator
{
    English(int64_t min, int64_t max) : HexInt64Validator(min, max)
    {
        setLocale(QLocale(QLocale::English, QLocale::UnitedStates));
    }
};

} // namespace

TEST(GotoValidator, DecimalValuesAreGroupedAndHexadecimalOnesAreLeftAlone)
{
    English v(0, 1'000'000);
    Typed t = type(v, "12345");
    EXPECT_EQ(t.state, QValidator::Acceptable);
    EXPECT_EQ(t.text, "12,345");
    EXPECT_EQ(t.pos, 6) << "the cursor stays at the end";

    t = type(v, "0x1F");
    EXPECT_EQ(t.state, QValidator::Acceptable);
    EXPECT_EQ(t.text, "0x1F");
    EXPECT_EQ(v.acceptedValue("0x1F"), 31);

    // Typing on inside a grouped number: separators are dropped before converting.
    t = type(v, "12,3456");
    EXPECT_EQ(t.state, QValidator::Acceptable);
    EXPECT_EQ(t.text, "123,456");
    EXPECT_EQ(v.acceptedValue("123,456"), 123456);
    EXPECT_EQ(v.acceptedValue(" 1 000 "), 1000);

    // A cursor in the middle is not moved to the end.
    t = type(v, "1234", 1);
    EXPECT_EQ(t.text, "1,234");
    EXPECT_EQ(t.pos, 1);
}

TEST(GotoValidator, EmptyAndUnfinishedInputIsIntermediate)
{
    English v(-100, 100);
    EXPECT_EQ(type(v, "").state, QValidator::Intermediate);
    EXPECT_EQ(type(v, "-").state, QValidator::Intermediate);
    EXPECT_EQ(type(v, "-0").state, QValidator::Intermediate);
    EXPECT_EQ(type(v, "0x").state, QValidator::Intermediate);
    EXPECT_EQ(type(v, "-0x").state, QValidator::Intermediate);
    EXPECT_FALSE(v.acceptedValue("").has_value());
    EXPECT_FALSE(v.acceptedValue("-").has_value());
}

TEST(GotoValidator, MalformedInputIsInvalid)
{
    English v(0, 1'000'000);
    EXPECT_EQ(type(v, "12a").state, QValidator::Invalid);
    EXPECT_EQ(type(v, "0x1G").state, QValidator::Invalid);
    EXPECT_EQ(type(v, "1.5").state, QValidator::Invalid);
    EXPECT_EQ(type(v, "99999999999999999999999").state, QValidator::Invalid) << "beyond 64 bits";
    EXPECT_EQ(type(v, "0x10000000000000000").state, QValidator::Invalid);
}

TEST(GotoValidator, RangesRefuseNegativeAndTooLargeValues)
{
    English positive(10, 500);
    EXPECT_EQ(type(positive, "-5").state, QValidator::Invalid) << "no sign when the minimum is not negative";
    EXPECT_EQ(type(positive, "-").state, QValidator::Invalid);
    EXPECT_EQ(type(positive, "5").state, QValidator::Intermediate) << "below the minimum but positive";
    EXPECT_EQ(type(positive, "501").state, QValidator::Invalid);
    EXPECT_EQ(type(positive, "0x1F5").state, QValidator::Invalid);
    EXPECT_EQ(type(positive, "500").state, QValidator::Acceptable);
    EXPECT_FALSE(positive.acceptedValue("5").has_value());

    English signedRange(-100, 50);
    EXPECT_EQ(type(signedRange, "-100").state, QValidator::Acceptable);
    EXPECT_EQ(type(signedRange, "-101").state, QValidator::Invalid) << "below a negative minimum";
    EXPECT_EQ(type(signedRange, "-0x10").state, QValidator::Acceptable);
    EXPECT_EQ(signedRange.acceptedValue("-0x10"), -16);
    EXPECT_EQ(type(signedRange, "-1000").text, "-1000") << "an invalid value is not rewritten";

    English full(INT64_MIN, INT64_MAX);
    EXPECT_EQ(full.acceptedValue("0x7FFFFFFFFFFFFFFF"), INT64_MAX);
    EXPECT_EQ(full.acceptedValue("-9223372036854775808"), INT64_MIN);
    EXPECT_FALSE(full.value("9223372036854775808").has_value());
}
