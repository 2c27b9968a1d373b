// The two highest precedence levels of the expression parser: postfix indexing, and primary expressions
// (literals, parenthesised expressions and the built-in names, which are the only identifiers the language
// has: macros were expanded before the expression is parsed).
#include <cmath>
#include <string_view>

#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/expr/literal_operators.h"
#include "ovmacro/foundations/stream.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

namespace {

enum class Builtin {
    kFalse,
    kTrue,
    kLen,
    kIsBool,
    kIsChar,
    kIsInt,
    kIsDouble,
    kIsString,
    kBool,
    kChar,
    kInt,
    kDouble,
    kString,
    kSin,
    kCos,
    kTan,
    kExp,
    kLog,
    kFile,
    kLine,
    kNone,
};

struct BuiltinName {
    std::string_view name;
    Builtin builtin;
};

// Names are matched exactly (case-sensitive, whole text).
constexpr BuiltinName kBuiltins[] = {
    {"false", Builtin::kFalse},
    {"true", Builtin::kTrue},
    {"len", Builtin::kLen},
    {"is_bool", Builtin::kIsBool},
    {"is_char", Builtin::kIsChar},
    {"is_int", Builtin::kIsInt},
    {"is_double", Builtin::kIsDouble},
    {"is_string", Builtin::kIsString},
    {"bool", Builtin::kBool},
    {"char", Builtin::kChar},
    {"int", Builtin::kInt},
    {"double", Builtin::kDouble},
    {"string", Builtin::kString},
    {"sin", Builtin::kSin},
    {"cos", Builtin::kCos},
    {"tan", Builtin::kTan},
    {"exp", Builtin::kExp},
    {"log", Builtin::kLog},
    {"__FILE__", Builtin::kFile},
    {"__LINE__", Builtin::kLine},
};

Builtin FindBuiltin(std::string_view name) {
    for (const BuiltinName& b : kBuiltins)
        if (b.name == name) return b.builtin;
    return Builtin::kNone;
}

// The cold and value-holding steps below are kept out of line, so that the functions every nesting level
// passes through keep small frames.

[[noreturn, gnu::noinline]] void ThrowUnexpectedToken(const ExpressionParser& parser) {
    StringStream ss(4096);
    ss << "Unexpected " << parser.Named(parser.token) << " after " << parser.Named(parser.lastToken) << " in expression";
    throw LexScannerException(ss.GetString(), parser.token);
}

// "[" index "]" after a value: the character at that index.
[[gnu::noinline]] void ParseIndexSuffix(ExpressionParser& parser, LSLiteral& result) {
    parser.ReadNextToken();
    LSLiteral index;
    parser.ParseExpression(index);
    result = result[index];
    parser.ParseGivenToken(TK_RBRACKET, "]");
}

[[gnu::noinline]] void SetLiteralValue(const LSToken& token, LSLiteral& result) {
    switch (token.GetType()) {
        case TK_INT:
            result = LSLiteral(token.GetLiteralInt64());
            break;
        case TK_HEX_INT:
            result = LSLiteral(token.GetLiteralHexInt64());
            break;
        case TK_FLOAT:
            result = LSLiteral(token.GetLiteralDouble());
            break;
        default: {
            // A single-quoted literal is a string too, whatever its length.
            basic_xstring s;
            token.GetLiteralString(s);
            result = LSLiteral(std::move(s));
            break;
        }
    }
}

// The names without an argument: true, false, __FILE__, __LINE__.
[[gnu::noinline]] void SetBuiltinConstant(const ExpressionParser& parser, Builtin builtin,
                                          LSLiteral& result) {
    if (builtin == Builtin::kFalse || builtin == Builtin::kTrue) {
        result = LSLiteral(builtin == Builtin::kTrue);
        return;
    }
    basic_xstring file;
    int64 line = -1;
    // Unknown file and line: the empty name, and -1 as elsewhere for a line that is not known.
    if (!parser.GetFilenameAndLineNumberAtCurrentPosition(file, line)) {
        file.clear();
        line = -1;
    }
    if (builtin == Builtin::kFile)
        result = LSLiteral(std::move(file));
    else
        result = LSLiteral(line);
}

// Replaces the argument of a built-in function of a value by its result. Type tests look at the type only;
// the casts convert explicitly, so they may lose information.
[[gnu::noinline]] void ApplyValueBuiltin(Builtin builtin, LSLiteral& value) {
    switch (builtin) {
        case Builtin::kLen:
            value = LSLiteral(value.GetLength());
            break;
        case Builtin::kIsBool:
            value = LSLiteral(value == LT_BOOL);
            break;
        case Builtin::kIsChar:
            value = LSLiteral(value == LT_CHAR);
            break;
        case Builtin::kIsInt:
            value = LSLiteral(value == LT_INT64);
            break;
        case Builtin::kIsDouble:
            value = LSLiteral(value == LT_FLOAT64);
            break;
        case Builtin::kIsString:
            value = LSLiteral(value == LT_STRING);
            break;
        case Builtin::kBool:
            value = LSLiteral(value.AsBool(true));
            break;
        case Builtin::kChar:
            value = LSLiteral::MakeChar(value.AsChar(true));
            break;
        case Builtin::kInt:
            value = LSLiteral(value.AsInt64(true));
            break;
        case Builtin::kDouble:
            value = LSLiteral(value.AsFloat64(true));
            break;
        case Builtin::kString:
            value = LSLiteral(value.AsString(true));
            break;
        default:
            break;
    }
}

// The floating-point functions, their argument already converted implicitly to a double.
[[gnu::noinline]] void ApplyMathBuiltin(const ExpressionParser& parser, Builtin builtin, double x,
                                        LSLiteral& result) {
    switch (builtin) {
        case Builtin::kSin:
            result = LSLiteral(std::sin(x));
            break;
        case Builtin::kCos:
            result = LSLiteral(std::cos(x));
            break;
        case Builtin::kTan:
            result = LSLiteral(std::tan(x));
            break;
        case Builtin::kExp:
            result = LSLiteral(std::exp(x));
            break;
        default:
            if (x <= 0.0) {
                StringStream ss(4096);
                ss << "Can't take log of value " << x;
                throw LexScannerException(ss.GetString(), parser.token);
            }
            result = LSLiteral(std::log(x));
            break;
    }
}

}  // namespace

void ExpressionParser::ParsePostFixExpression(LSLiteral& result) {
    ParsePrimaryExpression(result);
    for (;;) {
        switch (token.GetType()) {
            case TK_LBRACKET:
                ParseIndexSuffix(*this, result);
                break;
            case TK_DOT:
                ReadNextToken();
                throw LexScannerException("Dot operator currently not supported", token);
            case TK_LPAREN:
                ReadNextToken();
                throw LexScannerException("Function application currently not supported", token);
            default:
                return;
        }
    }
}

void ExpressionParser::ParsePrimaryExpression(LSLiteral& result) {
    switch (token.GetType()) {
        case TK_INT:
        case TK_HEX_INT:
        case TK_FLOAT:
        case TK_DQ_STRING:
        case TK_SQ_STRING:
            SetLiteralValue(token, result);
            ReadNextToken();
            return;
        case TK_IDENTIFIER:
            ParsePrimaryIdentifierExpression(result);
            return;
        case TK_LPAREN:
            ReadNextToken();
            ParseExpression(result);
            ParseGivenToken(TK_RPAREN, ")");
            return;
        default:
            ThrowUnexpectedToken(*this);
    }
}

void ExpressionParser::ParsePrimaryIdentifierExpression(LSLiteral& result) {
    const Builtin builtin = FindBuiltin(token.text.view());
    switch (builtin) {
        case Builtin::kFalse:
        case Builtin::kTrue:
        case Builtin::kFile:
        case Builtin::kLine:
            SetBuiltinConstant(*this, builtin, result);
            ReadNextToken();
            return;
        case Builtin::kSin:
        case Builtin::kCos:
        case Builtin::kTan:
        case Builtin::kExp:
        case Builtin::kLog:
            ApplyMathBuiltin(*this, builtin, ParseFloat64Arg(), result);
            return;
        case Builtin::kNone:
            ThrowUnexpectedToken(*this);
        default:
            // The functions of a value: the argument is parsed into result, then replaced by the result.
            ParseLiteralInBrackets(result);
            ApplyValueBuiltin(builtin, result);
            return;
    }
}

}  // namespace orvan
