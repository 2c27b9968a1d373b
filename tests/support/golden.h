// Golden cases: many end-to-end runs of ovmacro in one file, a case in two or three lines.
//
// Every tests/<folder>/*_cases.txt is a list of cases; a line's first character says what it holds, and the
// rest of the line after one blank is its text:
//
//     # a comment                   (between cases)
//     < @def m(a) = {[a]}\nm(1)     the template, t.ovm, also given on standard input; begins a case
//     + lib/inc.ovm: @def x = 1     another file of the case, beside t.ovm
//     $ --settings t.ovm            the whole argument list, instead of "t.ovm" ("-" reads standard input);
//                                   a case without a template begins here
//     > [1]                         the exact standard output (empty when absent)
//     ! 2:5 Too many arguments      an error report (exit 1): t.ovm line 2 column 5, or FILE:LINE:COLUMN, or
//                                   "-" for a report without a place; one '!' line per report
//     ? 2 ovmacro: unknown option   instead: the exact standard error (a line feed added) and exit status
//     = out.d: t.ovm: t.ovm         a file the run must leave, with its exact content ("<missing>": none)
//     | more                        continues the line before it on a new line; in a report, a line "..."
//                                   stands for any number of lines (the middle of a Python traceback)
//
// In a text, \n \t \r \\ and \xHH stand for their characters; any other backslash stays as written. Errors
// are checked in the gnu form (FILE:LINE:COLUMN: error: MESSAGE, then the echoed source line and its caret,
// which the tool's own cases check, then the other lines of the message); warnings and notes are left out of
// them, and checked with '?'. The depth named by "Macro expansion
// nested too deeply", and the chain of calls below it, depend on the build's stack and are compared as
// placeholders.
//
// OVMACRO_GOLDEN_REFRESH=1 build/.../ovmacro_<folder>_tests rewrites the expectations of every case that does
// not run as written from what the tool does now: read the diff before committing it.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

namespace orvan::testing {

struct GoldenCase {
    std::string caseFile;  // the *_cases.txt file
    int line = 0;          // where the case begins
    std::string input;
    std::vector<std::pair<std::string, std::string>> files;  // '+': name, text
    std::vector<std::string> args{"t.ovm"};
    std::string out;
    std::vector<std::string> errors;  // '!': "PLACE MESSAGE\nCONTEXT..."
    bool rawErr = false;              // '?': err and exitCode as given
    std::string err;
    int exitCode = 0;
    std::vector<std::pair<std::string, std::string>> leftFiles;  // '='
    std::string malformed;                                       // a line this reader does not know
};

void PrintTo(const GoldenCase& c, std::ostream* os);
std::vector<GoldenCase> LoadGoldenCases(const std::string& folder);
void RunGoldenCase(const GoldenCase& c);
std::string GoldenCaseName(const ::testing::TestParamInfo<GoldenCase>& info);

}  // namespace orvan::testing

// Runs every case of tests/<folder>/*_cases.txt as a test of its own.
#define OVMACRO_GOLDEN_CASES(folder)                                                              \
    class folder##GoldenCases : public ::testing::TestWithParam<::orvan::testing::GoldenCase> {};  \
    TEST_P(folder##GoldenCases, RunsAsWritten) { ::orvan::testing::RunGoldenCase(GetParam()); }    \
    INSTANTIATE_TEST_SUITE_P(Golden, folder##GoldenCases,                                         \
                             ::testing::ValuesIn(::orvan::testing::LoadGoldenCases(#folder)),     \
                             ::orvan::testing::GoldenCaseName)
