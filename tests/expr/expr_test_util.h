// Helpers of the expression tests: values written as text, so that a table row can state a result or an
// error.
#pragma once

#include <functional>
#include <string>

#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/expr/literal.h"
#include "ovmacro/foundations/text_format.h"

namespace orvan::testing {

inline LSLiteral I(long long v) {
    return LSLiteral(v);
}
inline LSLiteral F(double v) {
    return LSLiteral(v);
}
inline LSLiteral S(const char* s) {
    return LSLiteral(s);
}
inline LSLiteral C(char c) {
    return LSLiteral::MakeChar(c);
}
inline LSLiteral B(bool b) {
    return LSLiteral(b);
}
inline LSLiteral Undef() {
    return LSLiteral();
}
inline LSLiteral Void() {
    return LSLiteral::MakeVoid();
}

// A value as "<type> <value>": "int64 3", "float64 2.5", "string ab", "char 98" (the code), "bool true".
inline std::string Show(const LSLiteral& v) {
    const std::string type = TypeToString(v.GetType());
    switch (v.GetType()) {
        case LT_BOOL:
            return type + (v.GetBoolValue() ? " true" : " false");
        case LT_INT64:
            return type + " " + std::to_string(v.GetInt64Value());
        case LT_FLOAT64:
            return type + " " + ToString(v.GetFloat64Value());
        case LT_CHAR:
            return type + " " + std::to_string(static_cast<unsigned char>(v.GetCharValue()));
        case LT_STRING:
            return type + " " + v.GetStringValue();
        default:
            return type;
    }
}

// Runs fn; its result, or "!" and the message of the LiteralException it raised.
inline std::string ResultOrError(const std::function<std::string()>& fn) {
    try {
        return fn();
    } catch (const LiteralException& e) {
        return "!" + e.GetMessage();
    }
}

// Evaluates text with a fresh parser: the value, or "!" + message + "@" + offset of the error's position.
inline std::string Eval(const std::string& text) {
    ExpressionParser p;
    p.Init(text);
    try {
        LSLiteral r;
        p.ParseExpression(r);
        return Show(r);
    } catch (const LexScannerException& e) {
        return "!" + e.GetMessage() + "@" + std::to_string(e.GetPosition() - text.data());
    }
}

}  // namespace orvan::testing
