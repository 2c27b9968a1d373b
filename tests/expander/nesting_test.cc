// Tests of the guard against expansions nested without end: a macro that invokes itself, directly or through
// others, blocks, loops or conditions, stops with "Macro expansion nested too deeply" and a report of bounded
// length, also on a thread with a small stack; recursion that ends still works.
#include <gtest/gtest.h>
#include <pthread.h>

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;

constexpr const char* kTooDeep = "Macro expansion nested too deeply";

std::string Expand(const std::string& text) {
    FileScopeVarFrame frame;
    std::string out;
    MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out);
    return out;
}

bool InText(const std::string& text, const char* p) {
    const auto begin = reinterpret_cast<std::uintptr_t>(text.data());
    const auto pos = reinterpret_cast<std::uintptr_t>(p);
    return p && pos >= begin && pos <= begin + text.size();
}

// The lines of a message after its first.
std::vector<std::string> ContextLines(const std::string& message) {
    std::vector<std::string> lines;
    size_t at = message.find('\n');
    while (at != std::string::npos) {
        const size_t next = message.find('\n', at + 1);
        lines.push_back(
            message.substr(at + 1, next == std::string::npos ? std::string::npos : next - at - 1));
        at = next;
    }
    return lines;
}

// N of a last line "    ... N more context lines left out", or -1.
long long OmittedCount(const std::vector<std::string>& lines) {
    if (lines.empty()) return -1;
    long long n = -1;
    char tail[64] = {};
    if (std::sscanf(lines.back().c_str(), "    ... %lld more context lines left o%63s", &n, tail) != 2)
        return -1;
    return std::string(tail) == "ut" ? n : -1;
}

// Sets a lower depth limit for the calling thread for the scope of one test.
class DepthLimit {
  public:
    explicit DepthLimit(int64 limit) { MacroNestingGuard::SetDepthLimitForTesting(limit); }
    ~DepthLimit() { MacroNestingGuard::SetDepthLimitForTesting(0); }
    DepthLimit(const DepthLimit&) = delete;
    DepthLimit& operator=(const DepthLimit&) = delete;
};

constexpr const char* kCountdown = "@def count(int n) = {@if(n > 0){.count(n - 1)}}\ncount(";

const char* const kEndless[] = {
    "@def f = {f}\nf",
    "@def a = {b}\n@def b = {a}\na",
    "@def f(x) = {<f(x)>}\nf(1)",
    "@def f(int n) = {f(n + 1)}\nf(0)",
    "@nakeddef f = {f}\nf",
    "@def f = {@if(true){f}}\nf",
    "@def f = {@if(f){}}\nf",
    "@def f = {@while(f){}}\nf",
    "@def f = {@for(x in [1]){f}}\nf",
    "@def f = {@for(x in [f]){}}\nf",
    "@def int f = {f + 1}\nf",
    "@def g(h()) = {h(1)}\n@def f(x) = {g(f)}\nf(0)",
};

// With the default limit the report keeps 24 context lines of the chain and counts the rest.
TEST(NestingGuardTest, EndlessRecursionIsStoppedWithBoundedReport) {
    for (const char* input : kEndless) {
        SCOPED_TRACE(input);
        const std::string text = input;
        const char* position = nullptr;
        const std::string message = MessageOf([&] { Expand(text); }, position);
        EXPECT_EQ(message.rfind(kTooDeep, 0), 0u) << message.substr(0, 300);
        const std::vector<std::string> lines = ContextLines(message);
        EXPECT_LE(lines.size(), 25u) << message.substr(0, 2000);
        EXPECT_GT(OmittedCount(lines), 0) << (lines.empty() ? "" : lines.back());
        EXPECT_TRUE(InText(text, position));
    }
}

TEST(NestingGuardTest, ChainLinesInnermostFirst) {
    DepthLimit limit(100);
    {
        const std::string message = MessageOf([&] { Expand("@def f = {f}\nf"); });
        EXPECT_EQ(message.substr(0, message.find('\n')),
                  "Macro expansion nested too deeply (more than 100 levels): is a macro invoking itself?");
        const std::vector<std::string> lines = ContextLines(message);
        ASSERT_EQ(lines.size(), 25u);
        for (size_t i = 0; i < 24; ++i) EXPECT_EQ(lines[i], "    invoking macro f") << i;
        // One context line per level: the top text is level 1, and each of the 100 invocations adds a line.
        EXPECT_EQ(OmittedCount(lines), 100 - 24);
    }
    {
        // a -> b -> a ...: the innermost call is the one that could not expand its body.
        const std::string message = MessageOf([&] { Expand("@def a = {b}\n@def b = {a}\na"); });
        const std::vector<std::string> lines = ContextLines(message);
        ASSERT_EQ(lines.size(), 25u);
        for (size_t i = 0; i < 24; ++i) {
            // 100 invocations from a: the outermost (last) is a, so the innermost (first) is b.
            EXPECT_EQ(lines[i], i % 2 == 0 ? "    invoking macro b" : "    invoking macro a") << i;
        }
        EXPECT_EQ(OmittedCount(lines), 100 - 24);
    }
}

TEST(NestingGuardTest, RecursionThatEndsWorks) {
    // Each level is an invocation and a conditional block: 300 levels are 600 nested expansions.
    EXPECT_EQ(Expand(std::string(kCountdown) + "300)"), std::string(300, '.'));
    // Mutual recursion that ends.
    EXPECT_EQ(
        Expand(
            "@def even(int n) = {@if(n > 0){e odd(n - 1)}}\n@def odd(int n) = {@if(n > 0){o even(n - 1)}}\n"
            "even(6)"),
        "e o e o e o ");
}

TEST(NestingGuardTest, LimitCountsLevelsAndRecovers) {
    {
        DepthLimit limit(10);
        // count(k) needs 2k + 3 levels: the text, a body and a block per level, and the last condition.
        EXPECT_EQ(Expand(std::string(kCountdown) + "3)"), "...");
        const std::string message = MessageOf([&] { Expand(std::string(kCountdown) + "4)"); });
        EXPECT_EQ(message.substr(0, message.find('\n')),
                  "Macro expansion nested too deeply (more than 10 levels): is a macro invoking itself?");
        // A failed expansion leaves no levels counted behind.
        EXPECT_EQ(Expand(std::string(kCountdown) + "3)"), "...");
    }
    // Back to the default limit after an endless recursion.
    MessageOf([&] { Expand("@def f = {f}\nf"); });
    EXPECT_EQ(Expand(std::string(kCountdown) + "300)"), std::string(300, '.'));
}

// Runs fn on a thread with a stack of `stackBytes`.
void RunOnThreadWithStack(size_t stackBytes, const std::function<void()>& fn) {
    pthread_attr_t attr;
    ASSERT_EQ(pthread_attr_init(&attr), 0);
    ASSERT_EQ(pthread_attr_setstacksize(&attr, stackBytes), 0);
    pthread_t thread;
    auto body = [](void* arg) -> void* {
        (*static_cast<const std::function<void()>*>(arg))();
        return nullptr;
    };
    ASSERT_EQ(pthread_create(&thread, &attr, body, const_cast<std::function<void()>*>(&fn)), 0);
    pthread_attr_destroy(&attr);
    ASSERT_EQ(pthread_join(thread, nullptr), 0);
}

// On a small stack the guard stops before the stack runs out, and the error is an ordinary exception.
TEST(NestingGuardTest, SmallStackThreadGetsAnErrorNotACrash) {
    for (const char* input :
         {"@def f = {f}\nf", "@def f(x) = {@if(true){<f(x)>}}\nf(1)", "@def f = {@for(x in [1]){f}}\nf"}) {
        SCOPED_TRACE(input);
        std::string message;
        std::string countdown;
        std::string error;
        RunOnThreadWithStack(1024 * 1024, [&] {
            const std::string text = input;
            FileScopeVarFrame frame;
            std::string out;
            try {
                MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out);
            } catch (const LexScannerException& e) {
                message = e.GetMessage();
            }
            try {
                countdown = Expand(std::string(kCountdown) + "20)");
            } catch (const LexScannerException& e) {
                error = e.GetMessage();
            }
        });
        EXPECT_EQ(message.rfind(kTooDeep, 0), 0u) << message.substr(0, 300);
        EXPECT_LE(ContextLines(message).size(), 25u);
        EXPECT_EQ(countdown, std::string(20, '.')) << error;
    }
}

}  // namespace
}  // namespace orvan
