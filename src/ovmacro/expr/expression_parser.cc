// The expression parser: precedence levels 1 to 14 and the typed Parse... family. Levels 15 and 16 (postfix
// and primary expressions, with the built-in names) are in primary_expressions.cc.
#include "ovmacro/expr/expression_parser.h"

#include "ovmacro/expr/literal_operators.h"
#include "ovmacro/foundations/stream.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

namespace {

// Precedence of the infix operators of levels 3 to 13; 0 for any other token. Higher binds tighter.
constexpr int kLogicalOrLevel = 3;
constexpr int kLogicalAndLevel = 4;
constexpr int kBitwiseOrLevel = 5;
constexpr int kBitwiseExOrLevel = 6;
constexpr int kBitwiseAndLevel = 7;
constexpr int kEqualityLevel = 8;
constexpr int kRelationalLevel = 9;
constexpr int kShiftLevel = 10;
constexpr int kAdditiveLevel = 11;
constexpr int kMultiplicativeLevel = 12;
constexpr int kPowerLevel = 13;

int InfixLevel(EToken t) {
    switch (t) {
        case TK_OR_OR:
            return kLogicalOrLevel;
        case TK_AND_AND:
            return kLogicalAndLevel;
        case TK_BAR:
            return kBitwiseOrLevel;
        case TK_CARET:
            return kBitwiseExOrLevel;
        case TK_AMP:
            return kBitwiseAndLevel;
        case TK_EQ:
        case TK_NE:
            return kEqualityLevel;
        case TK_LT:
        case TK_GT:
        case TK_LE:
        case TK_GE:
            return kRelationalLevel;
        case TK_SHL:
        case TK_SHR:
            return kShiftLevel;
        case TK_PLUS:
        case TK_MINUS:
            return kAdditiveLevel;
        case TK_STAR:
        case TK_SLASH:
        case TK_PERCENT:
            return kMultiplicativeLevel;
        case TK_POWER:
            return kPowerLevel;
        default:
            return 0;
    }
}

// result = result <op> right, for an infix operator token. Kept out of line: its temporaries would otherwise
// sit in the frames of the recursion.
[[gnu::noinline]] void ApplyInfixOperator(EToken op, LSLiteral& result, const LSLiteral& right) {
    switch (op) {
        case TK_OR_OR:
            result = result || right;
            break;
        case TK_AND_AND:
            result = result && right;
            break;
        case TK_BAR:
            result = result | right;
            break;
        case TK_CARET:
            result = result ^ right;
            break;
        case TK_AMP:
            result = result & right;
            break;
        case TK_EQ:
            result = LSLiteral(IsEqual(result, right));
            break;
        case TK_NE:
            result = LSLiteral(!IsEqual(result, right));
            break;
        case TK_LT:
            result = LSLiteral(IsLess(result, right));
            break;
        case TK_GT:
            result = LSLiteral(IsLess(right, result));
            break;
        case TK_LE:
            result = LSLiteral(IsLessThanOrEqual(result, right));
            break;
        case TK_GE:
            result = LSLiteral(IsLessThanOrEqual(right, result));
            break;
        case TK_SHL:
            result = result << right;
            break;
        case TK_SHR:
            result = result >> right;
            break;
        case TK_PLUS:
            result = result + right;
            break;
        case TK_MINUS:
            result = result - right;
            break;
        case TK_STAR:
            result = result * right;
            break;
        case TK_SLASH:
            result = result / right;
            break;
        case TK_PERCENT:
            result = result % right;
            break;
        case TK_POWER:
            result = Power(result, right);
            break;
        default:
            break;
    }
}

// The infix operator whose operation a compound assignment applies ("+=" applies "+").
EToken OperatorOfAssignment(EToken op) {
    switch (op) {
        case TK_PLUS_EQ:
            return TK_PLUS;
        case TK_MINUS_EQ:
            return TK_MINUS;
        case TK_STAR_EQ:
            return TK_STAR;
        case TK_SLASH_EQ:
            return TK_SLASH;
        case TK_PERCENT_EQ:
            return TK_PERCENT;
        case TK_AMP_EQ:
            return TK_AMP;
        case TK_BAR_EQ:
            return TK_BAR;
        case TK_CARET_EQ:
            return TK_CARET;
        case TK_SHL_EQ:
            return TK_SHL;
        case TK_SHR_EQ:
            return TK_SHR;
        case TK_AND_AND_EQ:
            return TK_AND_AND;
        case TK_OR_OR_EQ:
            return TK_OR_OR;
        case TK_POWER_EQ:
            return TK_POWER;
        default:
            return TK_NONE;  // "=": the right value itself
    }
}

// The assignment operators after a left operand: each one's right operand is parsed and its operation
// computed, and then the assignment fails, since every value the parser computes is an r-value.
[[gnu::noinline]] void ParseAssignmentTail(ExpressionParser& parser, LSLiteral& result) {
    while (IsAssignmentToken(parser.token.GetType())) {
        const EToken op = OperatorOfAssignment(parser.token.GetType());
        parser.ReadNextToken();
        LSLiteral value;
        parser.ParseConditionalExpression(value);
        if (op != TK_NONE) {
            LSLiteral right = std::move(value);
            value = result;
            ApplyInfixOperator(op, value, right);
        }
        result.Assign(value);
    }
}

// A value error re-raised with the position of the parser's current token.
[[noreturn, gnu::noinline]] void ThrowAtToken(const basic_xstring& message, const LSToken& token) {
    throw LexScannerException(message, token);
}

[[gnu::noinline]] void ApplyPrefixOperator(EToken op, LSLiteral& result) {
    switch (op) {
        case TK_PLUS:
            result = +result;
            break;
        case TK_MINUS:
            result = -result;
            break;
        case TK_TILDE:
            result = ~result;
            break;
        default:
            result = LSLiteral(!result);
            break;
    }
}

}  // namespace

void ExpressionParser::ThrowNestedTooDeeply() const {
    StringStream ss(4096);
    ss << "Expression nested too deeply (more than " << maxDepth_ << " levels)";
    throw LexScannerException(ss.GetString(), token);
}

void ExpressionParser::ParseExpression(LSLiteral& result) {
    try {
        ParseAssignmentExpression(result);
    } catch (const LiteralException& e) {
        ThrowAtToken(e.GetMessage(), token);
    }
}

void ExpressionParser::UnsafeParseExpression(LSLiteral& result) {
    ParseAssignmentExpression(result);
}

void ExpressionParser::ParseAssignmentExpression(LSLiteral& result) {
    // Every parenthesis, index, built-in argument and middle operand of ?: comes through here.
    DepthGuard guard(*this);
    ParseConditionalExpression(result);
    if (IsAssignmentToken(token.GetType())) ParseAssignmentTail(*this, result);
}

void ExpressionParser::ParseConditionalExpression(LSLiteral& result) {
    ParseInfixExpression(kLogicalOrLevel, result);
    if (token.GetType() == TK_QUESTION) ParseConditionalTail(result);
}

[[gnu::noinline]] void ExpressionParser::ParseConditionalTail(LSLiteral& result) {
    ReadNextToken();
    LSLiteral ifTrue;
    ParseExpression(ifTrue);
    ParseGivenToken(TK_COLON, ":");
    LSLiteral ifFalse;
    {
        // Conditional operators group to the right: a ? b : c ? d : e nests one level per "?".
        DepthGuard guard(*this);
        ParseConditionalExpression(ifFalse);
    }
    // Both branches were evaluated; only now is the condition looked at.
    if (result.AsBool(false))
        result = std::move(ifTrue);
    else
        result = std::move(ifFalse);
}

// Left operand, then while an operator binds at least as tightly as minLevel, its right operand made of
// operators binding more tightly: every level is left-associative, and the result is that of one recursive
// function per level, without a frame per level on the way down to a nested parenthesis.
void ExpressionParser::ParseInfixExpression(int minLevel, LSLiteral& result) {
    ParseUnaryExpression(result);
    for (int level = InfixLevel(token.GetType()); level >= minLevel && level > 0;
         level = InfixLevel(token.GetType()))
        ParseInfixOperand(token.GetType(), level, result);
}

[[gnu::noinline]] void ExpressionParser::ParseInfixOperand(EToken op, int level, LSLiteral& result) {
    ReadNextToken();
    LSLiteral right;
    {
        DepthGuard guard(*this);
        ParseInfixExpression(level + 1, right);
    }
    ApplyInfixOperator(op, result, right);
}

void ExpressionParser::ParseLogicalOrExpression(LSLiteral& result) {
    ParseInfixExpression(kLogicalOrLevel, result);
}
void ExpressionParser::ParseLogicalAndExpression(LSLiteral& result) {
    ParseInfixExpression(kLogicalAndLevel, result);
}
void ExpressionParser::ParseBitwiseOrExpression(LSLiteral& result) {
    ParseInfixExpression(kBitwiseOrLevel, result);
}
void ExpressionParser::ParseBitwiseExOrExpression(LSLiteral& result) {
    ParseInfixExpression(kBitwiseExOrLevel, result);
}
void ExpressionParser::ParseBitwiseAndExpression(LSLiteral& result) {
    ParseInfixExpression(kBitwiseAndLevel, result);
}
void ExpressionParser::ParseEqualityExpression(LSLiteral& result) {
    ParseInfixExpression(kEqualityLevel, result);
}
void ExpressionParser::ParseRelationalExpression(LSLiteral& result) {
    ParseInfixExpression(kRelationalLevel, result);
}
void ExpressionParser::ParseShiftExpression(LSLiteral& result) {
    ParseInfixExpression(kShiftLevel, result);
}
void ExpressionParser::ParseAdditiveExpression(LSLiteral& result) {
    ParseInfixExpression(kAdditiveLevel, result);
}
void ExpressionParser::ParseMultiplicativeExpression(LSLiteral& result) {
    ParseInfixExpression(kMultiplicativeLevel, result);
}
void ExpressionParser::ParsePowerExpression(LSLiteral& result) {
    ParseInfixExpression(kPowerLevel, result);
}

void ExpressionParser::ParseUnaryExpression(LSLiteral& result) {
    const EToken op = token.GetType();
    if (op != TK_PLUS && op != TK_MINUS && op != TK_TILDE && op != TK_BANG) {
        ParsePostFixExpression(result);
        return;
    }
    ReadNextToken();
    {
        DepthGuard guard(*this);
        ParseUnaryExpression(result);
    }
    ApplyPrefixOperator(op, result);
}

void ExpressionParser::ParseLiteralInBrackets(LSLiteral& result) {
    ReadNextToken();
    ParseGivenToken(TK_LPAREN, "(");
    ParseExpression(result);
    ParseGivenToken(TK_RPAREN, ")");
}

double ExpressionParser::ParseFloat64Arg() {
    ReadNextToken();
    ParseGivenToken(TK_LPAREN, "(");
    const double value = ParseFloat64(false);
    ParseGivenToken(TK_RPAREN, ")");
    return value;
}

bool ExpressionParser::GetFilenameAndLineNumberAtCurrentPosition(basic_xstring& /*file*/,
                                                                 int64& /*line*/) const {
    return false;
}

namespace {

// The typed family: parse, check that a value came out, convert; value errors and refused conversions become
// LexScannerExceptions at the token current when they are caught.
[[noreturn, gnu::noinline]] void ThrowExpectedValue(const ExpressionParser& parser, const char* typeName) {
    StringStream ss(4096);
    ss << "Expected " << typeName << " when read " << parser.Named(parser.token);
    throw LexScannerException(ss.GetString(), parser.token);
}

template <class T, class Convert>
T ParseTyped(ExpressionParser& parser, const char* typeName, Convert convert) {
    try {
        LSLiteral value;
        parser.UnsafeParseExpression(value);
        if (value == LT_UNDEF) ThrowExpectedValue(parser, typeName);
        T out{};
        convert(value, out);
        return out;
    } catch (const LiteralException& e) {
        ThrowAtToken(e.GetMessage(), parser.token);
    }
}

}  // namespace

bool ExpressionParser::ParseBool(bool explicitConversion) {
    return ParseTyped<bool>(*this, "bool",
                            [&](const LSLiteral& v, bool& out) { v.AsBool(out, explicitConversion, true); });
}

char ExpressionParser::ParseChar(bool explicitConversion) {
    return ParseTyped<char>(*this, "character", [&](const LSLiteral& v, char& out) {
        if (v == LT_STRING && v.GetStringValue().size() == 1) {
            basic_xstring s;
            v.AsString(s, false, true);
            out = s[0];
            return;
        }
        v.AsChar(out, explicitConversion, true);
    });
}

signed char ExpressionParser::ParseInt8(bool explicitConversion) {
    return ParseTyped<signed char>(*this, "int8", [&](const LSLiteral& v, signed char& out) {
        v.AsInt8(out, explicitConversion, true);
    });
}

short ExpressionParser::ParseInt16(bool explicitConversion) {
    return ParseTyped<short>(
        *this, "int16", [&](const LSLiteral& v, short& out) { v.AsInt16(out, explicitConversion, true); });
}

int ExpressionParser::ParseInt32(bool explicitConversion) {
    return ParseTyped<int>(*this, "int32",
                           [&](const LSLiteral& v, int& out) { v.AsInt32(out, explicitConversion, true); });
}

int64 ExpressionParser::ParseInt64(bool explicitConversion) {
    return ParseTyped<int64>(
        *this, "int64", [&](const LSLiteral& v, int64& out) { v.AsInt64(out, explicitConversion, true); });
}

unsigned char ExpressionParser::ParseUInt8(bool explicitConversion) {
    return ParseTyped<unsigned char>(*this, "uint8", [&](const LSLiteral& v, unsigned char& out) {
        v.AsUInt8(out, explicitConversion, true);
    });
}

unsigned short ExpressionParser::ParseUInt16(bool explicitConversion) {
    return ParseTyped<unsigned short>(*this, "uint16", [&](const LSLiteral& v, unsigned short& out) {
        v.AsUInt16(out, explicitConversion, true);
    });
}

unsigned int ExpressionParser::ParseUInt32(bool explicitConversion) {
    return ParseTyped<unsigned int>(*this, "uint32", [&](const LSLiteral& v, unsigned int& out) {
        v.AsUInt32(out, explicitConversion, true);
    });
}

uint64 ExpressionParser::ParseUInt64(bool explicitConversion) {
    return ParseTyped<uint64>(
        *this, "uint64", [&](const LSLiteral& v, uint64& out) { v.AsUInt64(out, explicitConversion, true); });
}

float ExpressionParser::ParseFloat32(bool explicitConversion) {
    return ParseTyped<float>(*this, "float32", [&](const LSLiteral& v, float& out) {
        v.AsFloat32(out, explicitConversion, true);
    });
}

double ExpressionParser::ParseFloat64(bool explicitConversion) {
    return ParseTyped<double>(*this, "float64", [&](const LSLiteral& v, double& out) {
        v.AsFloat64(out, explicitConversion, true);
    });
}

basic_xstring ExpressionParser::ParseString(bool explicitConversion) {
    return ParseTyped<basic_xstring>(*this, "string", [&](const LSLiteral& v, basic_xstring& out) {
        v.AsString(out, explicitConversion, true);
    });
}

}  // namespace orvan
