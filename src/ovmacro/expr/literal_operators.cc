// The operators of the expression language and its comparisons.
//
// Operand types are tested directly rather than through the conversion functions: the result is the same as
// probing an implicit conversion, without copying strings on every comparison.
#include "ovmacro/expr/literal_operators.h"

#include <cmath>
#include <string_view>

#include "ovmacro/foundations/stream.h"

namespace orvan {

namespace {

bool IsInt(const LSLiteral& x) {
    return x.GetType() == LT_INT64;
}
bool IsNumber(const LSLiteral& x) {
    return x.GetType() == LT_INT64 || x.GetType() == LT_FLOAT64;
}
bool IsStringLike(const LSLiteral& x) {
    return x.GetType() == LT_STRING || x.GetType() == LT_CHAR;
}
// An int64 from 0 to 255 converts implicitly to the character with that code.
bool IsCharLike(const LSLiteral& x) {
    return x.GetType() == LT_CHAR ||
           (x.GetType() == LT_INT64 && x.GetInt64Value() >= 0 && x.GetInt64Value() <= 255);
}
unsigned char CharCode(const LSLiteral& x) {
    return x.GetType() == LT_CHAR ? static_cast<unsigned char>(x.GetCharValue())
                                  : static_cast<unsigned char>(x.GetInt64Value());
}

// A number as a double; int64 values are rounded to nearest.
double ToDouble(const LSLiteral& x) {
    return x.GetType() == LT_INT64 ? static_cast<double>(x.GetInt64Value()) : x.GetFloat64Value();
}

// The text of a string-like value; a character is viewed in place through `buffer`.
std::string_view TextOf(const LSLiteral& x, char& buffer) {
    if (x.GetType() == LT_STRING) return x.GetStringValue();
    buffer = x.GetCharValue();
    return std::string_view(&buffer, 1);
}

// Wrapping arithmetic: done in uint64, where overflow is defined, and read back as two's complement.
int64 WrapAdd(int64 a, int64 b) {
    return static_cast<int64>(static_cast<uint64>(a) + static_cast<uint64>(b));
}
int64 WrapSub(int64 a, int64 b) {
    return static_cast<int64>(static_cast<uint64>(a) - static_cast<uint64>(b));
}
int64 WrapMul(int64 a, int64 b) {
    return static_cast<int64>(static_cast<uint64>(a) * static_cast<uint64>(b));
}

void RequireInts(const LSLiteral& a, const LSLiteral& b, const char* op) {
    if (!IsInt(a) || !IsInt(b)) ThrowIncompatibleTypesException(a, b, op);
}

}  // namespace

LSLiteral operator+(const LSLiteral& a, const LSLiteral& b) {
    if (IsStringLike(a) && IsStringLike(b)) {
        char ca = 0, cb = 0;
        const std::string_view left = TextOf(a, ca), right = TextOf(b, cb);
        basic_xstring s;
        s.reserve(left.size() + right.size());
        s.append(left).append(right);
        return LSLiteral(std::move(s));
    }
    if (IsInt(a) && IsInt(b)) return LSLiteral(WrapAdd(a.GetInt64Value(), b.GetInt64Value()));
    if (IsNumber(a) && IsNumber(b)) return LSLiteral(ToDouble(a) + ToDouble(b));
    ThrowIncompatibleTypesException(a, b, "+");
}

LSLiteral operator-(const LSLiteral& a, const LSLiteral& b) {
    if (IsInt(a) && IsInt(b)) return LSLiteral(WrapSub(a.GetInt64Value(), b.GetInt64Value()));
    if (IsNumber(a) && IsNumber(b)) return LSLiteral(ToDouble(a) - ToDouble(b));
    ThrowIncompatibleTypesException(a, b, "-");
}

LSLiteral operator*(const LSLiteral& a, const LSLiteral& b) {
    if (IsInt(a) && IsInt(b)) return LSLiteral(WrapMul(a.GetInt64Value(), b.GetInt64Value()));
    if (IsNumber(a) && IsNumber(b)) return LSLiteral(ToDouble(a) * ToDouble(b));
    ThrowIncompatibleTypesException(a, b, "*");
}

LSLiteral operator/(const LSLiteral& a, const LSLiteral& b) {
    if (IsInt(a) && IsInt(b)) {
        const int64 x = a.GetInt64Value(), y = b.GetInt64Value();
        if (y == 0) throw LiteralException("Division by zero error");
        // The one quotient that does not fit: it wraps, as the other integer operations do.
        if (y == -1) return LSLiteral(WrapSub(0, x));
        return LSLiteral(x / y);
    }
    if (IsNumber(a) && IsNumber(b)) {
        const double y = ToDouble(b);
        if (y == 0.0) throw LiteralException("Division by zero");
        return LSLiteral(ToDouble(a) / y);
    }
    ThrowIncompatibleTypesException(a, b, "/");
}

LSLiteral operator%(const LSLiteral& a, const LSLiteral& b) {
    RequireInts(a, b, "%");
    const int64 x = a.GetInt64Value(), y = b.GetInt64Value();
    if (y == 0) throw LiteralException("Modulo zero error");
    // INT64_MIN % -1 would trap on x86; every remainder by -1 is 0.
    if (y == -1) return LSLiteral(int64{0});
    return LSLiteral(x % y);
}

LSLiteral operator&(const LSLiteral& a, const LSLiteral& b) {
    RequireInts(a, b, "&");
    return LSLiteral(a.GetInt64Value() & b.GetInt64Value());
}

LSLiteral operator|(const LSLiteral& a, const LSLiteral& b) {
    RequireInts(a, b, "|");
    return LSLiteral(a.GetInt64Value() | b.GetInt64Value());
}

LSLiteral operator^(const LSLiteral& a, const LSLiteral& b) {
    RequireInts(a, b, "^");
    return LSLiteral(a.GetInt64Value() ^ b.GetInt64Value());
}

LSLiteral operator<<(const LSLiteral& a, const LSLiteral& b) {
    RequireInts(a, b, "<<");
    const unsigned count = static_cast<unsigned>(static_cast<uint64>(b.GetInt64Value()) & 63u);
    return LSLiteral(static_cast<int64>(static_cast<uint64>(a.GetInt64Value()) << count));
}

LSLiteral operator>>(const LSLiteral& a, const LSLiteral& b) {
    RequireInts(a, b, ">>");
    const unsigned count = static_cast<unsigned>(static_cast<uint64>(b.GetInt64Value()) & 63u);
    // Right shifts of negative values are arithmetic (defined so since C++20).
    return LSLiteral(a.GetInt64Value() >> count);
}

LSLiteral operator&&(const LSLiteral& a, const LSLiteral& b) {
    if (!a.AsBool(false)) return LSLiteral(false);
    return LSLiteral(b.AsBool(false));
}

LSLiteral operator||(const LSLiteral& a, const LSLiteral& b) {
    if (a.AsBool(false)) return LSLiteral(true);
    return LSLiteral(b.AsBool(false));
}

LSLiteral Power(const LSLiteral& base, const LSLiteral& exponent) {
    if (!IsNumber(base) || !IsNumber(exponent)) ThrowIncompatibleTypesException(base, exponent, "^^");
    const double x = ToDouble(base), y = ToDouble(exponent);
    if (x == 0.0 && y < 0.0) {
        StringStream ss(4096);
        ss << "Calculation " << x << " ^^ " << y << " ill defined";
        throw LiteralException(ss.GetString());
    }
    const double r = std::pow(x, y);
    if (IsInt(base) && IsInt(exponent)) return LSLiteral(TruncateToInt64(r));
    return LSLiteral(r);
}

LSLiteral operator-(const LSLiteral& a) {
    if (IsInt(a)) return LSLiteral(WrapSub(0, a.GetInt64Value()));
    if (a.GetType() == LT_FLOAT64) return LSLiteral(-a.GetFloat64Value());
    ThrowIncompatibleTypeException(a, "-");
}

LSLiteral operator+(const LSLiteral& a) {
    if (IsNumber(a)) return a;
    ThrowIncompatibleTypeException(a, "+");
}

LSLiteral operator~(const LSLiteral& a) {
    if (IsInt(a)) return LSLiteral(~a.GetInt64Value());
    ThrowIncompatibleTypeException(a, "~");
}

bool operator!(const LSLiteral& a) {
    return !a.AsBool(false);
}

LSLiteral LSLiteral::operator[](const LSLiteral& index) const {
    if (type_ != LT_STRING) {
        StringStream ss(4096);
        ss << "[] not available on " << TypeToString(type_);
        throw LiteralException(ss.GetString());
    }
    const int i = index.AsInt32(false);
    const int64 length = static_cast<int64>(string_.size());
    if (i < 0 || i >= length) {
        StringStream ss(4096);
        ss << "Index " << i << " out of range [0," << length << ") on string";
        throw LiteralException(ss.GetString());
    }
    return MakeChar(string_[static_cast<size_t>(i)]);
}

bool IsEqual(const LSLiteral& a, const LSLiteral& b) {
    if (a.GetType() == LT_BOOL && b.GetType() == LT_BOOL) return a.GetBoolValue() == b.GetBoolValue();
    if (IsCharLike(a) && IsCharLike(b)) return CharCode(a) == CharCode(b);
    if (IsStringLike(a) && IsStringLike(b)) {
        char ca = 0, cb = 0;
        return TextOf(a, ca) == TextOf(b, cb);
    }
    if (IsInt(a) && IsInt(b)) return a.GetInt64Value() == b.GetInt64Value();
    if (IsNumber(a) && IsNumber(b)) return ToDouble(a) == ToDouble(b);
    ThrowIncompatibleTypesException(a, b, "comparison");
}

bool IsLess(const LSLiteral& a, const LSLiteral& b) {
    if (IsStringLike(a) && IsStringLike(b)) {
        // std::string_view orders by unsigned bytes, as the utility library's byte vectors do.
        char ca = 0, cb = 0;
        return TextOf(a, ca) < TextOf(b, cb);
    }
    if (IsInt(a) && IsInt(b)) return a.GetInt64Value() < b.GetInt64Value();
    if (IsNumber(a) && IsNumber(b)) return ToDouble(a) < ToDouble(b);
    ThrowIncompatibleTypesException(a, b, "comparison");
}

bool IsLessThanOrEqual(const LSLiteral& a, const LSLiteral& b) {
    if (IsStringLike(a) && IsStringLike(b)) return !IsLess(b, a);
    if (IsInt(a) && IsInt(b)) return a.GetInt64Value() <= b.GetInt64Value();
    if (IsNumber(a) && IsNumber(b)) return ToDouble(a) <= ToDouble(b);
    ThrowIncompatibleTypesException(a, b, "comparison");
}

bool operator==(const LSLiteral& a, const LSLiteral& b) {
    if (a.GetType() != b.GetType()) return false;
    switch (a.GetType()) {
        case LT_BOOL:
            return a.GetBoolValue() == b.GetBoolValue();
        case LT_CHAR:
            return a.GetCharValue() == b.GetCharValue();
        case LT_INT64:
            return a.GetInt64Value() == b.GetInt64Value();
        case LT_FLOAT64:
            return a.GetFloat64Value() == b.GetFloat64Value();
        case LT_STRING:
            return a.GetStringValue() == b.GetStringValue();
        default:
            return true;  // undef equals undef, void equals void
    }
}

bool operator!=(const LSLiteral& a, const LSLiteral& b) {
    return !(a == b);
}

}  // namespace orvan
