// The conversion table of LSLiteral: every source type against every target, implicit and explicit, and the
// narrow integer ranges; each conversion's three forms must agree.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>

#include "expr_test_util.h"

namespace orvan::testing {
namespace {

enum class To {
    Bool,
    Char,
    Int8,
    UInt8,
    Int16,
    UInt16,
    Int32,
    UInt32,
    Int64,
    UInt64,
    Float32,
    Float64,
    String
};

std::string Out(bool v) {
    return v ? "true" : "false";
}
std::string Out(char v) {
    return "char " + std::to_string(static_cast<unsigned char>(v));
}
std::string Out(float v) {
    return ToString(static_cast<double>(v));
}
std::string Out(double v) {
    return ToString(v);
}
std::string Out(const std::string& v) {
    return "\"" + v + "\"";
}
template <class T>
std::string Out(T v) {
    return std::to_string(v);
}

// The worker with errors raised gives the result; the quiet worker must agree without raising and leave `out`
// alone on failure, and CoercibleTo must tell whether the implicit conversion succeeds.
template <class T, class Worker, class Coercible>
std::string Check(const LSLiteral& v, bool explicitConversion, Worker worker, Coercible coercible) {
    T quiet{};
    bool quietOk = false;
    EXPECT_NO_THROW(quietOk = worker(v, quiet, explicitConversion, false));
    std::string shown;
    try {
        T out{};
        EXPECT_TRUE(worker(v, out, explicitConversion, true));
        shown = Out(out);
    } catch (const LiteralException& e) {
        shown = "!" + e.GetMessage();
    }
    EXPECT_EQ(quietOk, shown[0] != '!');
    EXPECT_EQ(Out(quiet), quietOk ? shown : Out(T{}));
    if (!explicitConversion) {
        EXPECT_EQ(coercible(v), quietOk);
    }
    return shown;
}

#define OVMACRO_CONVERT(X, T)                                                                             \
    Check<T>(                                                                                             \
        v, explicitConversion, [](const LSLiteral& l, T& o, bool e, bool t) { return l.As##X(o, e, t); }, \
        [](const LSLiteral& l) { return l.CoercibleTo##X(); })

std::string Convert(const LSLiteral& v, To to, bool explicitConversion) {
    switch (to) {
        case To::Bool:
            return OVMACRO_CONVERT(Bool, bool);
        case To::Char:
            return OVMACRO_CONVERT(Char, char);
        case To::Int8:
            return OVMACRO_CONVERT(Int8, signed char);
        case To::UInt8:
            return OVMACRO_CONVERT(UInt8, unsigned char);
        case To::Int16:
            return OVMACRO_CONVERT(Int16, short);
        case To::UInt16:
            return OVMACRO_CONVERT(UInt16, unsigned short);
        case To::Int32:
            return OVMACRO_CONVERT(Int32, int);
        case To::UInt32:
            return OVMACRO_CONVERT(UInt32, unsigned int);
        case To::Int64:
            return OVMACRO_CONVERT(Int64, int64);
        case To::UInt64:
            return OVMACRO_CONVERT(UInt64, uint64);
        case To::Float32:
            return OVMACRO_CONVERT(Float32, float);
        case To::Float64:
            return OVMACRO_CONVERT(Float64, double);
        case To::String:
            return OVMACRO_CONVERT(String, basic_xstring);
    }
    return "?";
}

#undef OVMACRO_CONVERT

const double kNaN = std::numeric_limits<double>::quiet_NaN();
const std::string kMin = std::to_string(std::numeric_limits<int64>::min());
const std::string kNoImplicit = "!No implicit conversion from ";

struct ConversionCase {
    LSLiteral value;
    To to;
    std::string implicitResult;  // "!" + message for an error
    std::string explicitResult;
};

const ConversionCase kTable[] = {
    // undef is a missing value; the narrow targets fail in their int64 step.
    {Undef(), To::Bool, "!Expected bool", "!Expected bool"},
    {Undef(), To::Char, "!Expected char", "!Expected char"},
    {Undef(), To::Int8, "!Expected int64", "!Expected int64"},
    {Undef(), To::UInt64, "!Expected int64", "!Expected int64"},
    {Undef(), To::Float32, "!Expected float32", "!Expected float32"},
    {Undef(), To::Float64, "!Expected float64", "!Expected float64"},
    {Undef(), To::String, "!Expected string", "!Expected string"},
    // void converts to nothing.
    {Void(), To::Bool, "!No conversion from void to bool", "!No conversion from void to bool"},
    {Void(), To::Char, "!No conversion from void to char", "!No conversion from void to char"},
    {Void(), To::Int16, "!No conversion from void to int64", "!No conversion from void to int64"},
    {Void(), To::Float32, "!No conversion from void to float32", "!No conversion from void to float32"},
    {Void(), To::Float64, "!No conversion from void to float64", "!No conversion from void to float64"},
    {Void(), To::String, "!No conversion from void to string", "!No conversion from void to string"},
    // bool: only to bool implicitly; numbers and text by a cast; never to char.
    {B(true), To::Bool, "true", "true"},
    {B(true), To::Char, "!No conversion from bool to char", "!No conversion from bool to char"},
    {B(true), To::Int8, kNoImplicit + "bool to int64", "1"},
    {B(false), To::UInt64, kNoImplicit + "bool to int64", "0"},
    {B(true), To::Float32, kNoImplicit + "bool to float32", "1.0"},
    {B(false), To::Float64, kNoImplicit + "bool to float64", "0.0"},
    {B(true), To::String, kNoImplicit + "bool to string", "\"true\""},
    {B(false), To::String, kNoImplicit + "bool to string", "\"false\""},
    // int64: to char by value, to floats rounded to nearest.
    {I(2), To::Bool, kNoImplicit + "int64 to bool", "true"},
    {I(0), To::Bool, kNoImplicit + "int64 to bool", "false"},
    {I(255), To::Char, "char 255", "char 255"},
    {I(256), To::Char, kNoImplicit + "value 256 to char", "char 0"},
    {I(-1), To::Char, kNoImplicit + "value -1 to char", "char 255"},
    {I(-1), To::UInt64, "18446744073709551615", "18446744073709551615"},
    {I(9007199254740993), To::Float64, "9007199254740992.0", "9007199254740992.0"},
    {I(16777217), To::Float32, "16777216.0", "16777216.0"},
    {I(-42), To::String, kNoImplicit + "int64 to string", "\"-42\""},
    // float64: to integers only by a cast, truncating; NaN and out-of-range values give the minimum.
    {F(-0.0), To::Bool, kNoImplicit + "float64 to bool", "false"},
    {F(kNaN), To::Bool, kNoImplicit + "float64 to bool", "true"},
    {F(65.0), To::Char, "!No conversion from float64 to char", "!No conversion from float64 to char"},
    {F(-2.7), To::Int64, kNoImplicit + "float64 to int64", "-2"},
    {F(-2.7), To::UInt64, kNoImplicit + "float64 to int64", "18446744073709551614"},
    {F(kNaN), To::Int64, kNoImplicit + "float64 to int64", kMin},
    {F(-1e300), To::Int64, kNoImplicit + "float64 to int64", kMin},
    {F(9223372036854775808.0), To::Int64, kNoImplicit + "float64 to int64", kMin},
    {F(-9223372036854775808.0), To::Int64, kNoImplicit + "float64 to int64", kMin},
    {F(9223372036854774784.0), To::Int64, kNoImplicit + "float64 to int64", "9223372036854774784"},
    {F(300.9), To::Int8, kNoImplicit + "float64 to int64", "44"},
    {F(0.1), To::Float32, "0.10000000149011612", "0.10000000149011612"},
    {F(-1e300), To::Float32, "-inf", "-inf"},
    {F(3.4028235e38), To::Float32, "3.4028234663852886e+38", "3.4028234663852886e+38"},  // rounds down
    {F(2.5), To::Float64, "2.5", "2.5"},
    {F(3.0), To::String, kNoImplicit + "float64 to string", "\"3.0\""},
    // char: its code (0 to 255) by a cast, a one-character string implicitly.
    {C('A'), To::Bool, "!No conversion from char to bool", "!No conversion from char to bool"},
    {C('A'), To::Char, "char 65", "char 65"},
    {C('\xC8'), To::Int64, kNoImplicit + "char to int64", "200"},
    {C('\xC8'), To::Int8, kNoImplicit + "char to int64", "-56"},
    {C('A'), To::Float32, "!No conversion from char to float32", "!No conversion from char to float32"},
    {C('A'), To::Float64, "!No conversion from char to float64", "!No conversion from char to float64"},
    {C('A'), To::String, "\"A\"", "\"A\""},
    // string: to string, and to char by a cast of exactly one character.
    {S("ab"), To::Bool, "!No conversion from string to bool", "!No conversion from string to bool"},
    {S("x"), To::Char, kNoImplicit + "value x to char", "char 120"},
    {S("ab"), To::Char, kNoImplicit + "value ab to char", kNoImplicit + "value ab to char"},
    {S(""), To::Char, kNoImplicit + "value  to char", kNoImplicit + "value  to char"},
    {S("1"), To::UInt16, "!No conversion from string to int64", "!No conversion from string to int64"},
    {S("1"), To::Float32, "!No conversion from string to float32", "!No conversion from string to float32"},
    {S("1"), To::Float64, "!No conversion from string to float64", "!No conversion from string to float64"},
    {S("ab"), To::String, "\"ab\"", "\"ab\""},
};

TEST(LiteralConversionTest, EverySourceAgainstEveryTarget) {
    for (const ConversionCase& c : kTable) {
        SCOPED_TRACE(Show(c.value) + " to target #" + std::to_string(static_cast<int>(c.to)));
        EXPECT_EQ(Convert(c.value, c.to, false), c.implicitResult);
        EXPECT_EQ(Convert(c.value, c.to, true), c.explicitResult);
    }
}

TEST(LiteralConversionTest, NarrowIntegerRanges) {
    const struct {
        long long value;
        To to;
        bool fits;
        std::string explicitResult;
        const char* name;
    } cases[] = {
        {-128, To::Int8, true, "-128", "int8"},
        {127, To::Int8, true, "127", "int8"},
        {-129, To::Int8, false, "127", "int8"},
        {128, To::Int8, false, "-128", "int8"},
        {300, To::Int8, false, "44", "int8"},
        {255, To::UInt8, true, "255", "uint8"},
        {-1, To::UInt8, false, "255", "uint8"},
        {256, To::UInt8, false, "0", "uint8"},
        {-32768, To::Int16, true, "-32768", "int16"},
        {32768, To::Int16, false, "-32768", "int16"},
        {65535, To::UInt16, true, "65535", "uint16"},
        {-1, To::UInt16, false, "65535", "uint16"},
        {-2147483648LL, To::Int32, true, "-2147483648", "int32"},
        {2147483648LL, To::Int32, false, "-2147483648", "int32"},
        {4294967295LL, To::UInt32, true, "4294967295", "uint32"},
        {4294967296LL, To::UInt32, false, "0", "uint32"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::to_string(c.value) + " to " + c.name);
        const std::string refused = kNoImplicit + "value " + std::to_string(c.value) + " to " + c.name;
        EXPECT_EQ(Convert(I(c.value), c.to, false), c.fits ? c.explicitResult : refused);
        EXPECT_EQ(Convert(I(c.value), c.to, true), c.explicitResult);
    }
}

TEST(LiteralConversionTest, BuildingBlocks) {
    double d = 0;
    EXPECT_FALSE(ConvertValue<double>(d, 2.5, false, false, LT_BOOL, "float64"));
    EXPECT_TRUE(ConvertValue<double>(d, 1.5, true, true, LT_BOOL, "float64"));
    EXPECT_EQ(d, 1.5);
    short s = 0;
    EXPECT_FALSE(CheckPotentiallyLossyConversion<short>(s, 40000, false, false, "int16"));
    EXPECT_TRUE(CheckPotentiallyLossyConversion<short>(s, 40000, true, false, "int16"));
    EXPECT_EQ(s, -25536);
    float f = 0;  // every int64 converts to a float implicitly
    EXPECT_TRUE(
        CheckPotentiallyLossyConversion<float>(f, std::numeric_limits<int64>::min(), false, true, "x"));
    EXPECT_EQ(f, -9223372036854775808.0f);
}

}  // namespace
}  // namespace orvan::testing
