// The conversions of LSLiteral between its types, implicit and explicit, and their building blocks.
#include <cfloat>
#include <cmath>
#include <limits>
#include <type_traits>

#include "ovmacro/expr/literal.h"
#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/text_format.h"

namespace orvan {

namespace {

// An undef value has not been computed yet: a missing value, rather than a value of the wrong type.
bool Expected(const char* what, bool throwOnFailure) {
    if (throwOnFailure) {
        StringStream ss(4096);
        ss << "Expected " << what;
        throw LiteralException(ss.GetString());
    }
    return false;
}

bool NoConversion(ELiteral from, const char* to, bool throwOnFailure) {
    if (throwOnFailure) ThrowNoConversion(from, to);
    return false;
}

}  // namespace

int64 TruncateToInt64(double d) {
    // [-2^63, 2^63) is exactly the set of doubles whose truncation fits; NaN fails both comparisons.
    constexpr double kTwoTo63 = 9223372036854775808.0;
    if (d >= -kTwoTo63 && d < kTwoTo63) return static_cast<int64>(d);
    return std::numeric_limits<int64>::min();
}

float RoundToFloat(double d) {
    // Converting a finite double outside the float range is undefined behaviour in C++, so the overflow that
    // IEEE rounding would give is made here: up to half a unit in the last place beyond the largest float the
    // result is still the largest float; from there on (the tie goes to the even neighbour) it is infinity.
    constexpr double kMax = FLT_MAX;
    constexpr double kOverflowAt = kMax + 0x1p103;
    if (std::isfinite(d) && std::fabs(d) > kMax) {
        const float limit = std::fabs(d) >= kOverflowAt ? std::numeric_limits<float>::infinity() : FLT_MAX;
        return d > 0 ? limit : -limit;
    }
    return static_cast<float>(d);
}

template <class T>
bool ConvertValue(T& out, T value, bool explicitConversion, bool throwOnFailure, ELiteral from,
                  const char* to) {
    if (explicitConversion) {
        out = std::move(value);
        return true;
    }
    if (throwOnFailure) ThrowNoImplicitConversion(from, to);
    return false;
}

template bool ConvertValue<float>(float&, float, bool, bool, ELiteral, const char*);
template bool ConvertValue<double>(double&, double, bool, bool, ELiteral, const char*);
template bool ConvertValue<basic_xstring>(basic_xstring&, basic_xstring, bool, bool, ELiteral, const char*);
template bool ConvertValue<int64>(int64&, int64, bool, bool, ELiteral, const char*);
template bool ConvertValue<bool>(bool&, bool, bool, bool, ELiteral, const char*);

template <class T>
bool CheckPotentiallyLossyConversion(T& out, int64 value, bool explicitConversion, bool throwOnFailure,
                                     const char* to) {
    if constexpr (std::is_floating_point_v<T>) {
        // Every int64 lies within the float range; the round trip compared in floating point always agrees.
        out = static_cast<T>(value);
        return true;
    } else {
        const T converted = static_cast<T>(value);  // the low bits, two's complement
        if (explicitConversion || static_cast<int64>(converted) == value) {
            out = converted;
            return true;
        }
        if (throwOnFailure) ThrowNoImplicitConversionFromValue<int64>(value, to);
        return false;
    }
}

template bool CheckPotentiallyLossyConversion<signed char>(signed char&, int64, bool, bool, const char*);
template bool CheckPotentiallyLossyConversion<unsigned char>(unsigned char&, int64, bool, bool, const char*);
template bool CheckPotentiallyLossyConversion<short>(short&, int64, bool, bool, const char*);
template bool CheckPotentiallyLossyConversion<unsigned short>(unsigned short&, int64, bool, bool,
                                                              const char*);
template bool CheckPotentiallyLossyConversion<int>(int&, int64, bool, bool, const char*);
template bool CheckPotentiallyLossyConversion<unsigned int>(unsigned int&, int64, bool, bool, const char*);
template bool CheckPotentiallyLossyConversion<float>(float&, int64, bool, bool, const char*);
template bool CheckPotentiallyLossyConversion<double>(double&, int64, bool, bool, const char*);

template <class T>
bool CheckPotentiallyLossyConversionForInteger(T& out, const LSLiteral& value, bool explicitConversion,
                                               bool throwOnFailure, const char* to) {
    int64 wide = 0;
    if (!value.AsInt64(wide, explicitConversion, throwOnFailure)) return false;
    return CheckPotentiallyLossyConversion<T>(out, wide, explicitConversion, throwOnFailure, to);
}

template bool CheckPotentiallyLossyConversionForInteger<signed char>(signed char&, const LSLiteral&, bool,
                                                                     bool, const char*);
template bool CheckPotentiallyLossyConversionForInteger<unsigned char>(unsigned char&, const LSLiteral&, bool,
                                                                       bool, const char*);
template bool CheckPotentiallyLossyConversionForInteger<short>(short&, const LSLiteral&, bool, bool,
                                                               const char*);
template bool CheckPotentiallyLossyConversionForInteger<unsigned short>(unsigned short&, const LSLiteral&,
                                                                        bool, bool, const char*);
template bool CheckPotentiallyLossyConversionForInteger<int>(int&, const LSLiteral&, bool, bool, const char*);
template bool CheckPotentiallyLossyConversionForInteger<unsigned int>(unsigned int&, const LSLiteral&, bool,
                                                                      bool, const char*);

bool LSLiteral::AsBool(bool& out, bool explicitConversion, bool throwOnFailure) const {
    switch (type_) {
        case LT_UNDEF:
            return Expected("bool", throwOnFailure);
        case LT_BOOL:
            out = scalar_.b;
            return true;
        case LT_INT64:
            return ConvertValue<bool>(out, scalar_.i != 0, explicitConversion, throwOnFailure, type_, "bool");
        case LT_FLOAT64:
            // A NaN is not equal to 0.0, hence true.
            return ConvertValue<bool>(out, scalar_.d != 0.0, explicitConversion, throwOnFailure, type_,
                                      "bool");
        default:
            return NoConversion(type_, "bool", throwOnFailure);
    }
}

bool LSLiteral::AsChar(char& out, bool explicitConversion, bool throwOnFailure) const {
    switch (type_) {
        case LT_UNDEF:
            return Expected("char", throwOnFailure);
        case LT_CHAR:
            out = scalar_.c;
            return true;
        case LT_INT64: {
            // A character is a code from 0 to 255, hence the unsigned check.
            unsigned char code = 0;
            if (!CheckPotentiallyLossyConversion<unsigned char>(code, scalar_.i, explicitConversion,
                                                                throwOnFailure, "char"))
                return false;
            out = static_cast<char>(code);
            return true;
        }
        case LT_STRING:
            if (explicitConversion && string_.size() == 1) {
                out = string_[0];
                return true;
            }
            if (throwOnFailure) ThrowNoImplicitConversionFromValue<basic_xstring>(string_, "char");
            return false;
        default:
            return NoConversion(type_, "char", throwOnFailure);
    }
}

bool LSLiteral::AsInt64(int64& out, bool explicitConversion, bool throwOnFailure) const {
    switch (type_) {
        case LT_UNDEF:
            return Expected("int64", throwOnFailure);
        case LT_INT64:
            out = scalar_.i;
            return true;
        case LT_BOOL:
            return ConvertValue<int64>(out, scalar_.b ? 1 : 0, explicitConversion, throwOnFailure, type_,
                                       "int64");
        case LT_FLOAT64:
            return ConvertValue<int64>(out, TruncateToInt64(scalar_.d), explicitConversion, throwOnFailure,
                                       type_, "int64");
        case LT_CHAR:
            return ConvertValue<int64>(out, static_cast<unsigned char>(scalar_.c), explicitConversion,
                                       throwOnFailure, type_, "int64");
        default:
            return NoConversion(type_, "int64", throwOnFailure);
    }
}

bool LSLiteral::AsUInt64(uint64& out, bool explicitConversion, bool throwOnFailure) const {
    int64 v = 0;
    if (!AsInt64(v, explicitConversion, throwOnFailure)) return false;
    out = static_cast<uint64>(v);
    return true;
}

bool LSLiteral::AsFloat32(float& out, bool explicitConversion, bool throwOnFailure) const {
    switch (type_) {
        case LT_UNDEF:
            return Expected("float32", throwOnFailure);
        case LT_FLOAT64:
            out = RoundToFloat(scalar_.d);
            return true;
        case LT_INT64:
            return CheckPotentiallyLossyConversion<float>(out, scalar_.i, explicitConversion, throwOnFailure,
                                                          "float32");
        case LT_BOOL:
            return ConvertValue<float>(out, scalar_.b ? 1.0f : 0.0f, explicitConversion, throwOnFailure,
                                       type_, "float32");
        default:
            return NoConversion(type_, "float32", throwOnFailure);
    }
}

bool LSLiteral::AsFloat64(double& out, bool explicitConversion, bool throwOnFailure) const {
    switch (type_) {
        case LT_UNDEF:
            return Expected("float64", throwOnFailure);
        case LT_FLOAT64:
            out = scalar_.d;
            return true;
        case LT_INT64:
            return CheckPotentiallyLossyConversion<double>(out, scalar_.i, explicitConversion, throwOnFailure,
                                                           "float64");
        case LT_BOOL:
            return ConvertValue<double>(out, scalar_.b ? 1.0 : 0.0, explicitConversion, throwOnFailure, type_,
                                        "float64");
        default:
            return NoConversion(type_, "float64", throwOnFailure);
    }
}

bool LSLiteral::AsString(basic_xstring& out, bool explicitConversion, bool throwOnFailure) const {
    switch (type_) {
        case LT_UNDEF:
            return Expected("string", throwOnFailure);
        case LT_STRING:
            out = string_;
            return true;
        case LT_CHAR:
            out.assign(1, scalar_.c);
            return true;
        default:
            break;
    }
    if (type_ != LT_BOOL && type_ != LT_INT64 && type_ != LT_FLOAT64)
        return NoConversion(type_, "string", throwOnFailure);
    // The text is made only when it may be used.
    basic_xstring text;
    if (explicitConversion) {
        if (type_ == LT_BOOL)
            text = scalar_.b ? "true" : "false";
        else if (type_ == LT_INT64)
            text = ToString(scalar_.i);
        else
            text = ToString(scalar_.d);
    }
    return ConvertValue<basic_xstring>(out, std::move(text), explicitConversion, throwOnFailure, type_,
                                       "string");
}

// The narrow integer targets: the int64 step, then the range of the target.
bool LSLiteral::AsInt8(signed char& out, bool explicitConversion, bool throwOnFailure) const {
    return CheckPotentiallyLossyConversionForInteger(out, *this, explicitConversion, throwOnFailure, "int8");
}
bool LSLiteral::AsUInt8(unsigned char& out, bool explicitConversion, bool throwOnFailure) const {
    return CheckPotentiallyLossyConversionForInteger(out, *this, explicitConversion, throwOnFailure, "uint8");
}
bool LSLiteral::AsInt16(short& out, bool explicitConversion, bool throwOnFailure) const {
    return CheckPotentiallyLossyConversionForInteger(out, *this, explicitConversion, throwOnFailure, "int16");
}
bool LSLiteral::AsUInt16(unsigned short& out, bool explicitConversion, bool throwOnFailure) const {
    return CheckPotentiallyLossyConversionForInteger(out, *this, explicitConversion, throwOnFailure,
                                                     "uint16");
}
bool LSLiteral::AsInt32(int& out, bool explicitConversion, bool throwOnFailure) const {
    return CheckPotentiallyLossyConversionForInteger(out, *this, explicitConversion, throwOnFailure, "int32");
}
bool LSLiteral::AsUInt32(unsigned int& out, bool explicitConversion, bool throwOnFailure) const {
    return CheckPotentiallyLossyConversionForInteger(out, *this, explicitConversion, throwOnFailure,
                                                     "uint32");
}

// The one-argument forms throw on failure; the CoercibleTo forms probe an implicit conversion silently.
#define OVMACRO_DEFINE_CONVERSION_FORMS(X, T)           \
    T LSLiteral::As##X(bool explicitConversion) const { \
        T out{};                                        \
        As##X(out, explicitConversion, true);           \
        return out;                                     \
    }                                                   \
    bool LSLiteral::CoercibleTo##X() const {            \
        T out{};                                        \
        return As##X(out, false, false);                \
    }

OVMACRO_DEFINE_CONVERSION_FORMS(Bool, bool)
OVMACRO_DEFINE_CONVERSION_FORMS(Char, char)
OVMACRO_DEFINE_CONVERSION_FORMS(Int8, signed char)
OVMACRO_DEFINE_CONVERSION_FORMS(UInt8, unsigned char)
OVMACRO_DEFINE_CONVERSION_FORMS(Int16, short)
OVMACRO_DEFINE_CONVERSION_FORMS(UInt16, unsigned short)
OVMACRO_DEFINE_CONVERSION_FORMS(Int32, int)
OVMACRO_DEFINE_CONVERSION_FORMS(UInt32, unsigned int)
OVMACRO_DEFINE_CONVERSION_FORMS(Int64, int64)
OVMACRO_DEFINE_CONVERSION_FORMS(UInt64, uint64)
OVMACRO_DEFINE_CONVERSION_FORMS(Float32, float)
OVMACRO_DEFINE_CONVERSION_FORMS(Float64, double)

#undef OVMACRO_DEFINE_CONVERSION_FORMS

basic_xstring LSLiteral::AsString(bool explicitConversion) const {
    basic_xstring out;
    AsString(out, explicitConversion, true);
    return out;
}

void LSLiteral::AsString(basic_xstring& out, bool explicitConversion) const {
    AsString(out, explicitConversion, true);
}

bool LSLiteral::CoercibleToString() const {
    // Probed without copying the characters.
    return type_ == LT_STRING || type_ == LT_CHAR;
}

}  // namespace orvan
