// Fuzz target: the expression parser. The first byte chooses the entry point (a plain expression, one of the
// typed parses, with or without explicit conversion, or a path); the rest is the expression text.
//
// Checked besides crashes: the parser never reads outside its text, and after a successful parse the current
// token lies inside the text.
#include "fuzz_support.h"
#include "ovmacro/expr/expression_parser.h"

using namespace orvan;

namespace {

// The entry points, each with the explicit-conversion flag.
using EntryPoint = void (*)(ExpressionParser&, bool);
constexpr EntryPoint kEntryPoints[] = {
    [](ExpressionParser& p, bool) {
        LSLiteral value;
        p.ParseExpression(value);
    },
    [](ExpressionParser& p, bool x) { (void)p.ParseBool(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseChar(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseInt8(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseInt16(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseInt32(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseInt64(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseUInt8(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseUInt16(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseUInt32(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseUInt64(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseFloat32(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseFloat64(x); },
    [](ExpressionParser& p, bool x) { (void)p.ParseString(x); },
    [](ExpressionParser& p, bool) { (void)p.ParsePath(); },
};
constexpr size_t kEntryPointCount = sizeof(kEntryPoints) / sizeof(kEntryPoints[0]);

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0 || size > kMaxFuzzInputSize) return 0;
    const EntryPoint entry = kEntryPoints[(data[0] >> 1) % kEntryPointCount];
    const bool explicitConversion = data[0] & 1;
    const char* text = reinterpret_cast<const char*>(data) + 1;
    const BasicSubString input(text, text + size - 1);

    ExpressionParser parser;
    // The directives present "(" as the token before the expression, so that errors name it.
    parser.GetToken() = LSToken(TK_LPAREN, "(");
    try {
        parser.Init(input);
        entry(parser, explicitConversion);
        FUZZ_CHECK(ViewWithin(parser.GetToken().text, input));
    } catch (const IException&) {
    }
    return 0;
}
