// Tests of the output streams: what GetString hands over, indentation of lines by Indenter, and the readable
// form of a character in error messages.
#include "ovmacro/foundations/stream.h"

#include <gtest/gtest.h>

namespace orvan {
namespace {

TEST(StringStreamTest, GetStringHandsOverAndEmptiesTheStream) {
    StringStream ss;
    ss << "line " << 12 << ": " << 2.5 << ' ' << -7LL << ' ' << 3.0;
    EXPECT_EQ(ss.str(), "line 12: 2.5 -7 3.0");
    EXPECT_EQ(ss.str(), "line 12: 2.5 -7 3.0") << "str() does not take the text";
    EXPECT_EQ(ss.GetString(), "line 12: 2.5 -7 3.0");
    EXPECT_EQ(ss.GetString(), "");
    ss << "next";
    EXPECT_EQ(ss.GetString(), "next") << "the stream is usable after GetString";

    basic_xstring out = "old";
    ss << "new";
    ss.GetString(out, true);
    EXPECT_EQ(out, "new");
    EXPECT_EQ(ss.str(), "");
    ss << "+more";
    ss.GetString(out, false);
    EXPECT_EQ(out, "new+more");
    EXPECT_EQ(ss.str(), "");
    ss.GetString(out, true);
    EXPECT_EQ(out, "") << "replacing with an empty stream empties the string";
}

TEST(StringStreamTest, WritesEmbeddedNulsAndIgnoresEmptyRuns) {
    StringStream ss;
    const char text[] = {'a', '\0', 'b'};
    ss.put(text, 3);
    ss.put(text, 0);
    ss.put(text, -1);
    ss << static_cast<const char*>(nullptr);
    EXPECT_EQ(ss.GetString(), std::string(text, 3));
}

struct IndenterCase {
    const char* name;
    void (*write)(xostream& os);
    const char* expected;
};

const IndenterCase kIndenterCases[] = {
    {"every line it begins",
     [](xostream& os) {
         Indenter in(os, 2);
         os << "a\nb\n";
     },
     "  a\n  b\n"},
    {"lines made of several writes are indented once",
     [](xostream& os) {
         Indenter in(os, 2);
         os << "a"
            << "b" << '\n'
            << "c";
     },
     "  ab\n  c"},
    {"nested indenters add up and end in order",
     [](xostream& os) {
         os << "{\n";
         {
             Indenter outer(os, 4);
             os << "x\n";
             {
                 Indenter inner(os, 2);
                 os << "y\n";
             }
             os << "z\n";
         }
         os << "}\n";
     },
     "{\n    x\n      y\n    z\n}\n"},
    {"a line begun before the indenter is not indented in its middle",
     [](xostream& os) {
         os << "abc";
         Indenter in(os, 2);
         os << "x\ny\n";
     },
     "abcx\n  y\n"},
    {"a line ended after an indenter is known to be ended to the next one",
     [](xostream& os) {
         {
             Indenter in(os, 2);
             os << "a";
         }
         os << "\n";
         Indenter in(os, 2);
         os << "b\n";
     },
     "  a\n  b\n"},
    {"empty lines get the indentation too",
     [](xostream& os) {
         Indenter in(os, 1);
         os << "\n\n";
     },
     " \n \n"},
    {"wide indentation",
     [](xostream& os) {
         Indenter in(os, 40);
         os << "x";
     },
     "                                        x"},
};

TEST(IndenterTest, IndentsTheLinesWrittenWhileItLives) {
    for (const IndenterCase& c : kIndenterCases) {
        SCOPED_TRACE(c.name);
        StringStream ss;
        c.write(ss);
        EXPECT_EQ(ss.GetString(), c.expected);
        ss << "after\n";
        EXPECT_EQ(ss.GetString(), "after\n") << "no indentation once the indenters are gone";
    }
}

TEST(HumanReadableCharTest, FirstCharacterOrEos) {
    const struct {
        std::string text;
        const char* expected;
    } cases[] = {
        {"", "EOS"},       {"abc", "a"},          {" x", " "},
        {"'", "'"},        {"\n", "\\x0A"},       {std::string(1, '\0'), "\\x00"},
        {"\x7F", "\\x7F"}, {"\xC3\xA9", "\\xC3"},
    };
    for (const auto& c : cases) {
        StringStream ss;
        ss << HumanReadableCharInSubString(BasicSubString(c.text));
        EXPECT_EQ(ss.GetString(), c.expected);
    }
}

}  // namespace
}  // namespace orvan
