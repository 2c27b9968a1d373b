// The nesting limit of the expression parser: deep or adversarial expressions end in an error, never in a
// stack overflow, on a thread with a 1 MiB stack (the smallest that hosts commonly give).
#include <gtest/gtest.h>
#include <pthread.h>

#include <functional>
#include <string>

#include "expr_test_util.h"
#include "ovmacro/expr/expression_parser.h"
#include "support/test_support.h"

namespace orvan::testing {
namespace {

// Runs fn on a new thread whose stack is 1 MiB. fn must not throw.
void RunOnOneMebibyteStack(const std::function<void()>& fn) {
    pthread_attr_t attr;
    ASSERT_EQ(pthread_attr_init(&attr), 0);
    ASSERT_EQ(pthread_attr_setstacksize(&attr, 1 << 20), 0);
    pthread_t thread;
    const auto body = [](void* arg) -> void* {
        (*static_cast<const std::function<void()>*>(arg))();
        return nullptr;
    };
    ASSERT_EQ(pthread_create(&thread, &attr, body, const_cast<std::function<void()>*>(&fn)), 0);
    pthread_join(thread, nullptr);
    pthread_attr_destroy(&attr);
}

std::string Repeat(const std::string& s, int n) {
    std::string out;
    out.reserve(s.size() * static_cast<size_t>(n));
    for (int i = 0; i < n; ++i) out += s;
    return out;
}

const char kTooDeep[] = "Expression nested too deeply";

bool IsTooDeep(const std::string& evalResult) {
    return evalResult.rfind(std::string("!") + kTooDeep, 0) == 0;
}

TEST(ExpressionDepthTest, ReportsTheLimitAtTheCurrentToken) {
    // The whole expression is one level, and each parenthesis another.
    for (const char* ok : {"1", "(1)", "((1))"}) {
        ExpressionParser p;
        p.SetMaxExpressionDepth(3);
        p.Init(ok);
        LSLiteral r;
        EXPECT_NO_THROW(p.ParseExpression(r)) << ok;
    }
    const std::string text = "(((1)))";
    ExpressionParser p;
    p.SetMaxExpressionDepth(3);
    p.Init(text);
    LSLiteral r;
    const char* position = nullptr;
    EXPECT_EQ(MessageOf([&] { p.ParseExpression(r); }, position),
              "Expression nested too deeply (more than 3 levels)");
    EXPECT_EQ(position, text.data() + 3);

    // The levels of an abandoned parse are given back: the same parser reaches its full depth again.
    p.Init("((2))");
    EXPECT_NO_THROW(p.ParseExpression(r));
    EXPECT_EQ(Show(r), "int64 2");
}

TEST(ExpressionDepthTest, DeepestAllowedExpressionsFitInOneMebibyte) {
    // For each kind of nesting, the deepest expression the default limit allows is parsed on a 1 MiB stack,
    // and one more level is refused. The shapes include the costliest levels (built-in arguments, indexing,
    // right operands of every precedence level).
    const struct {
        const char* open;
        const char* close;
        const char* core;
    } shapes[] = {
        {"(", ")", "1"},
        {"- ", "", "1"},
        {"len(string(", "))", "1"},
        {"sin(", ")", "1"},
        {"'abc'[", "]", "1"},
        {"true?1:", "", "1"},
        {"true?(", "):1", "1"},
        {"!", "", "true"},
        {"1+(", ")", "1"},
        {"1||1&&1|1^1&1==1<1<<1+1*1^^len(", ")", "'a'"},
        {"1=1||1&&1|1^1&1==1<1<<1+1*1^^'abc'[", "]", "1"},
    };
    std::vector<std::string> failures;
    RunOnOneMebibyteStack([&] {
        for (const auto& s : shapes) {
            // Increase the nesting until the limit refuses it.
            int n = 1;
            std::string result;
            for (; n <= ExpressionParser::kMaxExpressionDepth + 1; ++n) {
                result = Eval(Repeat(s.open, n) + s.core + Repeat(s.close, n));
                if (IsTooDeep(result)) break;
            }
            if (n == 1 || !IsTooDeep(result)) failures.push_back(std::string(s.open) + " -> " + result);
        }
    });
    EXPECT_TRUE(failures.empty()) << ::testing::PrintToString(failures);
}

TEST(ExpressionDepthTest, HugeNestingEndsInAnErrorNotACrash) {
    const std::string shapes[] = {
        Repeat("(", 100000) + "1" + Repeat(")", 100000),
        Repeat("-", 100000) + "1",  // "--" tokens: a syntax error found without recursion
        Repeat("- ", 100000) + "1",
        Repeat("!", 100000) + "true",
        Repeat("true?1:", 100000) + "0",
        Repeat("'abc'[", 100000) + "0" + Repeat("]", 100000),
        Repeat("len(", 100000) + "'a'" + Repeat(")", 100000),
        Repeat("1+(", 100000) + "1" + Repeat(")", 100000),
    };
    std::vector<std::string> results;
    RunOnOneMebibyteStack([&] {
        for (const std::string& text : shapes) results.push_back(Eval(text));
    });
    ASSERT_EQ(results.size(), std::size(shapes));
    EXPECT_EQ(results[1], "!Unexpected -- after EOS in expression@0");
    for (size_t i = 0; i < results.size(); ++i) {
        if (i != 1) {
            EXPECT_TRUE(IsTooDeep(results[i])) << i << ": " << results[i].substr(0, 100);
        }
    }
}

}  // namespace
}  // namespace orvan::testing
