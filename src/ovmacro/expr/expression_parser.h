// ExpressionParser: evaluates an expression of the macro language while it parses it.
//
//     ExpressionParser p;
//     p.Init(text);                           // text whose macros were already expanded
//     int64 n = p.ParseInt64(false);          // implicit conversion only
//     if (p.GetTokenType() != TK_EOS) ...     // the caller decides what may follow
//
// Recursive descent over sixteen precedence levels, from assignment (lowest) to primary expressions, with the
// infix levels 3 to 13 parsed by precedence climbing; each rule computes its LSLiteral at once, so no tree is
// built. Every infix level is left-associative, and both
// operands of every operator are evaluated (no short-circuit, also for ?:). Value errors (LiteralException)
// leave ParseExpression and the typed Parse... family as LexScannerExceptions at the current token.
//
// Nesting is bounded: each level of parentheses, brackets, built-in arguments, nested ?:, prefix operators
// and right operands uses stack, so past GetMaxExpressionDepth() levels the parser raises "Expression nested
// too deeply" at the current token instead of overflowing the stack.
#pragma once

#include "ovmacro/expr/literal.h"
#include "ovmacro/expr/parser_base.h"

namespace orvan {

class ExpressionParser : public ParserBase {
  public:
    // Deep enough for any expression a person writes, and far from the end of a 1 MiB thread stack: a level
    // (a parenthesis, an index, a built-in's argument, a nested ?:, a prefix operator or the right operand of
    // an infix operator) costs at most about 0.5 KB of stack in optimised builds, and up to about 2.8 KB in
    // an unoptimised AddressSanitizer build, so the limit stays below 100 KB and 600 KB respectively.
    static constexpr int kMaxExpressionDepth = 200;

    ExpressionParser() = default;
    ExpressionParser(const ExpressionParser&) = default;
    ExpressionParser& operator=(const ExpressionParser&) = default;
    virtual ~ExpressionParser() = default;

    // One expression from `token` on; `token` is left at the first token after it.
    void ParseExpression(LSLiteral& result);
    // The same, letting LiteralExceptions pass through unconverted.
    void UnsafeParseExpression(LSLiteral& result);

    // The precedence levels, lowest first.
    void ParseAssignmentExpression(LSLiteral& result);   // 1: = += -= *= /= %= &= |= ^= <<= >>= &&= ||= ^^=
    void ParseConditionalExpression(LSLiteral& result);  // 2: ?:, grouping to the right
    void ParseLogicalOrExpression(LSLiteral& result);    // 3: ||
    void ParseLogicalAndExpression(LSLiteral& result);   // 4: &&
    void ParseBitwiseOrExpression(LSLiteral& result);    // 5: |
    void ParseBitwiseExOrExpression(LSLiteral& result);  // 6: ^
    void ParseBitwiseAndExpression(LSLiteral& result);   // 7: &
    void ParseEqualityExpression(LSLiteral& result);     // 8: == !=
    void ParseRelationalExpression(LSLiteral& result);   // 9: < > <= >=
    void ParseShiftExpression(LSLiteral& result);        // 10: << >>
    void ParseAdditiveExpression(LSLiteral& result);     // 11: + -
    void ParseMultiplicativeExpression(LSLiteral& result);  // 12: * / %
    void ParsePowerExpression(LSLiteral& result);           // 13: ^^
    void ParseUnaryExpression(LSLiteral& result);           // 14: prefix + - ~ !
    void ParsePostFixExpression(LSLiteral& result);         // 15: indexing
    void ParsePrimaryExpression(LSLiteral& result);         // 16: literals, built-in names, ( )
    void ParsePrimaryIdentifierExpression(LSLiteral& result);

    // An expression converted to the given type (a cast's conversion when explicitConversion). Value errors
    // and refused conversions raise a LexScannerException at the current token.
    bool ParseBool(bool explicitConversion);
    // A string of exactly one character also gives that character.
    char ParseChar(bool explicitConversion);
    signed char ParseInt8(bool explicitConversion);
    short ParseInt16(bool explicitConversion);
    int ParseInt32(bool explicitConversion);
    int64 ParseInt64(bool explicitConversion);
    unsigned char ParseUInt8(bool explicitConversion);
    unsigned short ParseUInt16(bool explicitConversion);
    unsigned int ParseUInt32(bool explicitConversion);
    uint64 ParseUInt64(bool explicitConversion);
    float ParseFloat32(bool explicitConversion);
    double ParseFloat64(bool explicitConversion);
    basic_xstring ParseString(bool explicitConversion);

    // The argument of a built-in function: consumes the current token (the name), then "(" expression ")".
    void ParseLiteralInBrackets(LSLiteral& result);
    // The same, with the argument converted implicitly to a double.
    double ParseFloat64Arg();

    // Where the current token lies, for __FILE__ and __LINE__. A bare expression parser knows no file: false,
    // and nothing is set. A parser of files overrides it.
    virtual bool GetFilenameAndLineNumberAtCurrentPosition(basic_xstring& file, int64& line) const;

    int GetMaxExpressionDepth() const { return maxDepth_; }
    void SetMaxExpressionDepth(int depth) { maxDepth_ = depth; }

  private:
    // Counts one nesting level while it lives; raises the nesting error past the limit.
    class DepthGuard {
      public:
        explicit DepthGuard(ExpressionParser& parser) : parser_(parser) {
            if (parser_.depth_ >= parser_.maxDepth_) parser_.ThrowNestedTooDeeply();
            ++parser_.depth_;
        }
        ~DepthGuard() { --parser_.depth_; }
        DepthGuard(const DepthGuard&) = delete;
        DepthGuard& operator=(const DepthGuard&) = delete;

      private:
        ExpressionParser& parser_;
    };

    // Levels 3 to 13 by precedence climbing: the operators binding at least as tightly as minLevel.
    void ParseInfixExpression(int minLevel, LSLiteral& result);

    // The parts of a rule that hold values of their own are kept out of the functions that every nesting
    // level passes through, so that a level costs as little stack as possible.
    void ParseConditionalTail(LSLiteral& result);
    void ParseInfixOperand(EToken op, int level, LSLiteral& result);
    [[noreturn]] void ThrowNestedTooDeeply() const;

    int depth_ = 0;
    int maxDepth_ = kMaxExpressionDepth;
};

}  // namespace orvan
