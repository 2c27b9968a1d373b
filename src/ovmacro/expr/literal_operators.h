// The operators of the expression language on LSLiteral values.
//
// Each takes evaluated operands, leaves them unchanged and returns a new value; a type error or an undefined
// result (division by zero, 0 ^^ -1, an index out of range) raises a LiteralException. Operators decide by
// the types of their operands, as implicit conversions allow:
//   - numbers (int64, float64): two int64 compute in int64 with wrap-around, otherwise in doubles;
//   - string-like values (string, char): + concatenates, comparisons compare the texts;
//   - % and the bitwise operators and shifts take int64 only; &&, || and ! take bool only.
#pragma once

#include "ovmacro/expr/literal.h"

namespace orvan {

LSLiteral operator+(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator-(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator*(const LSLiteral& a, const LSLiteral& b);
// int64 quotients truncate toward zero ("Division by zero error" for 0); float64 quotients are IEEE
// ("Division by zero" for a divisor of 0.0 of either sign).
LSLiteral operator/(const LSLiteral& a, const LSLiteral& b);
// The remainder of truncating division (the dividend's sign); "Modulo zero error" for 0.
LSLiteral operator%(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator&(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator|(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator^(const LSLiteral& a, const LSLiteral& b);
// Shift counts are taken modulo 64; >> is arithmetic.
LSLiteral operator<<(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator>>(const LSLiteral& a, const LSLiteral& b);
// The right operand is not looked at when the left one decides; both must otherwise be bools.
LSLiteral operator&&(const LSLiteral& a, const LSLiteral& b);
LSLiteral operator||(const LSLiteral& a, const LSLiteral& b);
// base ^^ exponent: an int64 (truncated) when both are int64, else a float64.
LSLiteral Power(const LSLiteral& base, const LSLiteral& exponent);

LSLiteral operator-(const LSLiteral& a);
LSLiteral operator+(const LSLiteral& a);
LSLiteral operator~(const LSLiteral& a);
bool operator!(const LSLiteral& a);

// Equality and order as the expression language sees them: across types where a conversion relates them
// (1 == 1.0, 65 == 'A' as a character, a character equals its one-character string); an error for types that
// cannot be compared (a bool and a number, anything and undef).
bool IsEqual(const LSLiteral& a, const LSLiteral& b);
bool IsLess(const LSLiteral& a, const LSLiteral& b);
bool IsLessThanOrEqual(const LSLiteral& a, const LSLiteral& b);

// Structural equality: same type and same value (1 and 1.0 differ). The expression language does not use it.
bool operator==(const LSLiteral& a, const LSLiteral& b);
bool operator!=(const LSLiteral& a, const LSLiteral& b);

}  // namespace orvan
