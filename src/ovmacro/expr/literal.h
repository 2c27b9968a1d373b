// LSLiteral: the typed value of the expression language, and the conversions between its types.
//
// A value is one of seven types. Conversions come in two strengths: implicit ones, made wherever a value of
// another type is expected, never lose information (an integer target only takes values that fit); explicit
// ones (casts) may truncate. Every conversion has three forms:
//
//     int v;
//     if (lit.AsInt32(v, /*explicitConversion=*/false, /*throwOnFailure=*/false)) ...  // the worker
//     int w = lit.AsInt32(true);          // throws a LiteralException when not allowed
//     bool ok = lit.CoercibleToInt32();   // would an implicit conversion succeed?
//
// Value errors are LiteralExceptions, which carry only a message; the expression parser gives them a
// position.
#pragma once

#include <cstdint>
#include <utility>

#include "ovmacro/foundations/types.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

enum ELiteral : std::int32_t {
    LT_UNDEF = 0,  // no value yet
    LT_VOID = 1,   // the result of something that yields nothing
    LT_BOOL = 2,
    LT_INT64 = 3,    // every integer value
    LT_FLOAT64 = 4,  // IEEE double
    LT_CHAR = 5,     // one 8-bit character
    LT_STRING = 6,
};

// The name of a type as messages show it: "undef", "void", "bool", "int64", "float64", "char", "string".
const char* TypeToString(ELiteral type);

// An error of a value operation: a failed conversion, an operator applied to the wrong types, a division by
// zero. It has no position; the expression parser turns it into a LexScannerException at its current token.
class LiteralException : public IException {
  public:
    explicit LiteralException(const char* message) : message_(message ? message : "") {}
    explicit LiteralException(basic_xstring message) : message_(std::move(message)) {}

    void Write(xostream& os) const override;
    const char* what() const noexcept override { return message_.c_str(); }
    const basic_xstring& GetMessage() const { return message_; }

  private:
    basic_xstring message_;
};

class LSLiteral {
  public:
    LSLiteral() { scalar_.i = 0; }
    explicit LSLiteral(bool b) : type_(LT_BOOL) { scalar_.b = b; }
    // Every integer, whatever its width, is an int64 value; a signed char is a number, not a character.
    explicit LSLiteral(signed char v) : LSLiteral(static_cast<long long>(v)) {}
    explicit LSLiteral(short v) : LSLiteral(static_cast<long long>(v)) {}
    explicit LSLiteral(int v) : LSLiteral(static_cast<long long>(v)) {}
    explicit LSLiteral(long v) : LSLiteral(static_cast<long long>(v)) {}
    explicit LSLiteral(long long v) : type_(LT_INT64) { scalar_.i = v; }
    explicit LSLiteral(double d) : type_(LT_FLOAT64) { scalar_.d = d; }
    explicit LSLiteral(const basic_xstring& s) : type_(LT_STRING), string_(s) { scalar_.i = 0; }
    explicit LSLiteral(basic_xstring&& s) : type_(LT_STRING), string_(std::move(s)) { scalar_.i = 0; }
    // Without this a string literal argument would silently become a bool (pointer to bool conversion).
    explicit LSLiteral(const char* s) : LSLiteral(basic_xstring(s ? s : "")) {}

    static LSLiteral MakeChar(char c) {
        LSLiteral lit;
        lit.type_ = LT_CHAR;
        lit.scalar_.c = c;
        return lit;
    }
    static LSLiteral MakeVoid() {
        LSLiteral lit;
        lit.type_ = LT_VOID;
        return lit;
    }

    ELiteral GetType() const { return type_; }
    bool operator==(ELiteral t) const { return type_ == t; }
    bool operator!=(ELiteral t) const { return type_ != t; }

    // The stored value, read without conversion; each is meaningful only for its own type.
    bool GetBoolValue() const { return scalar_.b; }
    char GetCharValue() const { return scalar_.c; }
    int64 GetInt64Value() const { return scalar_.i; }
    double GetFloat64Value() const { return scalar_.d; }
    const basic_xstring& GetStringValue() const { return string_; }

    // The number of characters of a string; "len() not available on <type>" for any other type.
    int64 GetLength() const;
    // A value is never a place: this always raises "Can't assign to <type>" (undef, void) or
    // "Can't assign to <type> r-value".
    [[noreturn]] void Assign(const LSLiteral& value) const;
    // The character at `index` of a string, as an LT_CHAR value (see literal_operators.cc).
    LSLiteral operator[](const LSLiteral& index) const;

    // Conversions: see the banner of this file for the three forms.
    bool AsBool(bool& out, bool explicitConversion, bool throwOnFailure) const;
    bool AsBool(bool explicitConversion) const;
    bool CoercibleToBool() const;

    bool AsChar(char& out, bool explicitConversion, bool throwOnFailure) const;
    char AsChar(bool explicitConversion) const;
    bool CoercibleToChar() const;

    bool AsInt8(signed char& out, bool explicitConversion, bool throwOnFailure) const;
    signed char AsInt8(bool explicitConversion) const;
    bool CoercibleToInt8() const;

    bool AsUInt8(unsigned char& out, bool explicitConversion, bool throwOnFailure) const;
    unsigned char AsUInt8(bool explicitConversion) const;
    bool CoercibleToUInt8() const;

    bool AsInt16(short& out, bool explicitConversion, bool throwOnFailure) const;
    short AsInt16(bool explicitConversion) const;
    bool CoercibleToInt16() const;

    bool AsUInt16(unsigned short& out, bool explicitConversion, bool throwOnFailure) const;
    unsigned short AsUInt16(bool explicitConversion) const;
    bool CoercibleToUInt16() const;

    bool AsInt32(int& out, bool explicitConversion, bool throwOnFailure) const;
    int AsInt32(bool explicitConversion) const;
    bool CoercibleToInt32() const;

    bool AsUInt32(unsigned int& out, bool explicitConversion, bool throwOnFailure) const;
    unsigned int AsUInt32(bool explicitConversion) const;
    bool CoercibleToUInt32() const;

    bool AsInt64(int64& out, bool explicitConversion, bool throwOnFailure) const;
    int64 AsInt64(bool explicitConversion) const;
    bool CoercibleToInt64() const;

    // The int64 conversion, its bits read as unsigned: messages name "int64".
    bool AsUInt64(uint64& out, bool explicitConversion, bool throwOnFailure) const;
    uint64 AsUInt64(bool explicitConversion) const;
    bool CoercibleToUInt64() const;

    bool AsFloat32(float& out, bool explicitConversion, bool throwOnFailure) const;
    float AsFloat32(bool explicitConversion) const;
    bool CoercibleToFloat32() const;

    bool AsFloat64(double& out, bool explicitConversion, bool throwOnFailure) const;
    double AsFloat64(bool explicitConversion) const;
    bool CoercibleToFloat64() const;

    bool AsString(basic_xstring& out, bool explicitConversion, bool throwOnFailure) const;
    basic_xstring AsString(bool explicitConversion) const;
    void AsString(basic_xstring& out, bool explicitConversion) const;
    bool CoercibleToString() const;

  private:
    // The scalar types share eight bytes; only the member of the current type is ever read.
    union Scalar {
        bool b;
        char c;
        int64 i;
        double d;
    };

    ELiteral type_ = LT_UNDEF;
    Scalar scalar_;
    basic_xstring string_;
};

// Conversion building blocks. Each writes `out` and returns true on success; on failure it raises a
// LiteralException when throwOnFailure, else returns false.

// For conversions that only a cast may make: succeeds only when explicitConversion, else "No implicit
// conversion from <from> to <to>". Available for float, double, basic_xstring, int64 and bool.
template <class T>
bool ConvertValue(T& out, T value, bool explicitConversion, bool throwOnFailure, ELiteral from,
                  const char* to);

// Converts an int64 to T (for integers: the low bits, two's complement). Implicitly the value must survive
// the round trip, else "No implicit conversion from value <value> to <to>"; every int64 converts to a
// floating type (rounded to nearest). Available for the six narrow integer types, char, float and double.
template <class T>
bool CheckPotentiallyLossyConversion(T& out, int64 value, bool explicitConversion, bool throwOnFailure,
                                     const char* to);

// The narrow integer conversions: AsInt64 with the same flags (its errors name "int64"), then the range step.
template <class T>
bool CheckPotentiallyLossyConversionForInteger(T& out, const LSLiteral& value, bool explicitConversion,
                                               bool throwOnFailure, const char* to);

// Truncates toward zero; NaN and values outside the int64 range give the most negative int64.
int64 TruncateToInt64(double d);
// Rounds to the nearest float; values beyond the float range become infinities of their sign.
float RoundToFloat(double d);

// Error raisers: each composes its message and throws a LiteralException.
[[noreturn]] void ThrowNoConversion(const char* from, const char* to);
[[noreturn]] void ThrowNoConversion(ELiteral from, const char* to);
[[noreturn]] void ThrowNoImplicitConversion(const char* from, const char* to);
[[noreturn]] void ThrowNoImplicitConversion(ELiteral from, const char* to);
// "No implicit conversion from value <v> to <to>"; available for int64 (decimal) and basic_xstring (as is).
template <class T>
[[noreturn]] void ThrowNoImplicitConversionFromValue(const T& v, const char* to);
[[noreturn]] void ThrowIncompatibleTypeException(const LSLiteral& x, const char* op);
[[noreturn]] void ThrowIncompatibleTypesException(const LSLiteral& x, const LSLiteral& y, const char* op);

}  // namespace orvan
