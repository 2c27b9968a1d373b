// --help and the manual page: the option table and the sections below, rendered as plain text or as roff.
//
// A section's text is paragraphs separated by empty lines; a paragraph whose lines begin with four blanks is
// shown as written (examples, tables), any other is flowed: wrapped at 79 columns in --help, filled by the
// formatter in the manual page.
#include "manual.h"

#include <string_view>

#include "options.h"

namespace ovmacro_tool {

namespace {

struct Section {
    const char* title;      // the manual page's heading
    const char* helpTitle;  // the heading in --help: "" for none; null: the section is only in the manual
    const char* text;
};

constexpr const char* kSynopsis = "ovmacro [OPTIONS] [FILE]";
constexpr const char* kSummary = "expand the macros of a text template";

// The sections before the options.
constexpr Section kDescription = {
    "DESCRIPTION", "",
    "Expands the macros of FILE (standard input when FILE is - or absent) and writes the expansion to "
    "standard output. Files that FILE imports with @import \"NAME\" are expanded in the same scope, so that "
    "their definitions are visible after the @import, which leaves the expansion with its line (see "
    "--keep-imports)."};

// The sections after the options, in order.
constexpr Section kSections[] = {
    {"THE LANGUAGE AT A GLANCE", nullptr,
     "Ordinary text is copied with its layout; directives begin with @. A definition, a comment and the "
     "other statement-like directives vanish with their line.\n"
     "\n"
     "    @def f(a, int b) = {body}    a macro; a type word makes a value\n"
     "                                 or an argument typed\n"
     "    f(x, 2)                      a call: the body, arguments in place\n"
     "    @if(c){...}@elseif(c){...}@else{...}\n"
     "                                 conditions are bool expressions\n"
     "    @for(x in [a, b]){...}       loops; also @for((k, v) in [...])\n"
     "                                 and @while(c){...}\n"
     "    @let int n = 2 + 3           typed variables; @let n = n * 2,\n"
     "                                 @let string s := text\n"
     "    @scope{...}                  a block with its own names\n"
     "    @str(text), @unstr(\"t\")      a C string literal, and back;\n"
     "                                 @strx, @strW, @quote(text)\n"
     "    @(expr), @[text]             a value as text; double expansion\n"
     "    @print(...), @println(...)   text to standard output\n"
     "    @assert(c), @fail(\"why\")     checks; also @assertfails(...)\n"
     "    @import \"file\"               a file expanded in the same scope;\n"
     "                                 also @importpath \"dir\"\n"
     "    @$NAME = \"value\"             a dollar macro: $(NAME) in strings\n"
     "    @runpython{...}              Python 3 statements\n"
     "    @// comment, @@              a comment; nothing (ends a name)\n"
     "\n"
     "Expressions have the types bool, int64, float64, char and string, with casts (int(x), string(x)...), "
     "type tests (is_int(x)...), len, sin, cos, tan, exp, log, __FILE__ and __LINE__."},
    {"OUTPUT FILES", "Output files",
     "OUT, DEPFILE and MAPFILE are written only when every one of them can be: each is written to a "
     "temporary file in its folder and renamed into place, so that a file is replaced whole or not at all, "
     "even by a killed run or by runs that write it at the same time. A replaced file keeps its mode; other "
     "hard links to it keep the old content. A symlink is followed and its target replaced. A device or a "
     "FIFO is written, never replaced, and a file whose folder is not writable is rewritten in place. None "
     "of them may be FILE, a file that FILE imports, or one of the others."},
    {"SOURCE MAPS", "Source maps",
     "A JSON object {\"version\": 1, \"output\": OUT or \"-\", \"files\": [the loaded files, in load order], "
     "\"mappings\": [...]}, each mapping an object with \"offset\", \"length\", \"line\", \"column\", "
     "\"kind\" and, when the run has a source, \"file\", \"sourceLine\", \"sourceColumn\" (and "
     "\"sourceLength\" for calculated runs). The mappings tile the output in order; offset and length count "
     "bytes of the output, line and column are where the run starts in it. kind is \"copied\" (the run is "
     "the text at file (an index into files), sourceLine, sourceColumn), \"calculated\" (text that the "
     "sourceLength bytes there produced: a macro value, a @str result...), \"indent\" (blanks that indent a "
     "nested text) or \"marker\" (a #line line)."},
    {"LINE MARKERS", "Line markers",
     "The template line of an output line is that of its first character, other than a blank or tab, that "
     "comes from a loaded file; lines without one (blank lines) never get a marker. A marker is written when "
     "the template file or line differs from the one the compiler presumes (that of the last marker plus the "
     "output lines since), but never after a line ending in a backslash, in a /* */ comment or in a raw "
     "string literal."},
    {"DIAGNOSTICS", "Error reports",
     "An error is reported on standard error as FILE(LINE) : MESSAGE, after an empty line, followed by the "
     "context lines that it gathered on its way out: the macros it was invoked through, the directive it was "
     "in. An error in an imported file is reported at its own file and line, followed by the importer's "
     "report Can't import file: NAME. For a file bad.ovm of the two lines\n"
     "\n"
     "    @def int twice(int n) = {n * 2}\n"
     "    twice(1 + x)\n"
     "\n"
     "the report is\n"
     "\n"
     "    bad.ovm(2) : Unexpected x after + in expression\n"
     "        expression: 1 + x\n"
     "        passing formal argument n to macro twice\n"
     "    bad.ovm(1) : note: twice is defined here\n"
     "\n"
     "A note follows an error that names a macro (where it is defined) or an unknown word close to a name in "
     "scope (did you mean that name, and where it is defined). A warning is FILE(LINE) : warning: TEXT "
     "[-WNAME]; see -W.\n"
     "\n"
     "With --diagnostics=gnu the first line is FILE:LINE:COLUMN: error: MESSAGE, then come the source line "
     "and a caret under the column, then the context lines; an error at a place in no file is reported as "
     "ovmacro: error: MESSAGE. Lines and columns count from 1; a column counts bytes, so a tab counts 1.\n"
     "\n"
     "    bad.ovm:2:11: error: Unexpected x after + in expression\n"
     "    twice(1 + x)\n"
     "              ^\n"
     "        expression: 1 + x\n"
     "        passing formal argument n to macro twice\n"
     "    bad.ovm:1:10: note: twice is defined here\n"
     "    @def int twice(int n) = {n * 2}\n"
     "             ^\n"
     "\n"
     "A usage error is reported as ovmacro: MESSAGE, followed by Try 'ovmacro --help'."},
    {"EXIT STATUS", "Exit status",
     "0 on success; 1 when the expansion or the settings fail (the error is reported on standard error) or "
     "--check finds OUT different or missing, or -Werror meets a warning; 2 on a usage error, an unreadable FILE or an output that "
     "cannot be written."},
    {"EXAMPLES", nullptr,
     "Generate a header and a dependency file for the build, with a definition and an import folder:\n"
     "\n"
     "    ovmacro -D MODE=release -I templates/common \\\n"
     "        --deps colors.h.d -o colors.h colors.ovm\n"
     "\n"
     "Check in CI that a generated file kept in the repository is current:\n"
     "\n"
     "    ovmacro --check --output=colors.h colors.ovm\n"
     "\n"
     "Print the settings of a project description:\n"
     "\n"
     "    ovmacro --settings project.ovp\n"
     "\n"
     "Expand standard input, and a file whose name begins with a dash:\n"
     "\n"
     "    printf '@def hi(x) = {Hello x!}\\nhi(World)\\n' | ovmacro\n"
     "    ovmacro -- -draft.ovm"},
};

constexpr size_t kWidth = 79;
constexpr size_t kHelpColumn = 28;  // where the help of an option begins in --help

bool IsVerbatim(std::string_view paragraph) { return paragraph.starts_with("    "); }

// Calls fn with each paragraph of a section's text.
template <typename Fn>
void ForEachParagraph(std::string_view text, Fn fn) {
    while (!text.empty()) {
        const size_t end = text.find("\n\n");
        fn(text.substr(0, end));
        text = end == std::string_view::npos ? std::string_view() : text.substr(end + 2);
    }
}

// Appends text flowed into lines of at most kWidth columns: the first after `first` (already in out), the
// others after `indent` blanks. A word longer than a line stands alone on its line.
void Flow(std::string& out, std::string_view text, size_t first, size_t indent) {
    size_t column = first;
    bool lineEmpty = true;
    while (!text.empty()) {
        const size_t blank = text.find(' ');
        const std::string_view word = text.substr(0, blank);
        text = blank == std::string_view::npos ? std::string_view() : text.substr(blank + 1);
        if (word.empty()) continue;
        if (!lineEmpty && column + 1 + word.size() > kWidth) {
            out += '\n' + std::string(indent, ' ');
            column = indent;
            lineEmpty = true;
        }
        if (!lineEmpty) {
            out += ' ';
            ++column;
        }
        out += word;
        column += word.size();
        lineEmpty = false;
    }
    out += '\n';
}

void AppendHelpSection(std::string& out, const Section& section) {
    if (*section.helpTitle) out += std::string(section.helpTitle) + ":\n";
    bool firstParagraph = true;
    ForEachParagraph(section.text, [&](std::string_view paragraph) {
        if (!firstParagraph) out += '\n';
        firstParagraph = false;
        if (IsVerbatim(paragraph))
            out += std::string(paragraph) + '\n';
        else
            Flow(out, paragraph, 0, 0);
    });
}

// "-o, --output=OUT", "    --deps=DEPFILE", "    --trace[=NAME,...]" or "-WNAME", as --help shows an
// option; roff marks the manual page's form.
std::string OptionForms(const OptionSpec& spec, bool roff) {
    auto bold = [&](const std::string& s) { return roff ? "\\fB" + s + "\\fR" : s; };
    const std::string dash = roff ? "\\-" : "-";
    std::string forms;
    const std::string name = spec.valueName ? spec.valueName : "";
    const std::string value = roff && !name.empty() ? "\\fI" + name + "\\fR" : name;
    if (!spec.longName) {  // -WNAME
        forms = bold(dash + spec.shortName) + value;
        return roff ? forms : "  " + forms;
    }
    if (spec.shortName) forms = bold(dash + spec.shortName) + ", ";
    else if (!roff) forms = "    ";
    forms += bold(dash + dash + std::string(spec.longName));
    if (!value.empty()) forms += spec.optionalValue ? "[=" + value + "]" : "=" + value;
    return roff ? forms : "  " + forms;
}

// Text for roff: backslashes escaped, a dash that begins an option word made a minus sign (a plain '-' is a
// hyphen, which a reader could not copy into a command line), and a control character at the start of a
// line made text.
std::string Roff(std::string_view text) {
    std::string out;
    bool wordStart = true;
    bool optionWord = false;
    for (const char c : text) {
        if (wordStart && (c == '.' || c == '\'') && (out.empty() || out.back() == '\n')) out += "\\&";
        if (wordStart) optionWord = c == '-';
        if (c == '\\')
            out += "\\e";
        else if (c == '-' && optionWord)
            out += "\\-";
        else
            out += c;
        wordStart = c == ' ' || c == '\n' || c == '(' || c == '[' || c == '"';
    }
    return out;
}

void AppendManualSection(std::string& out, const Section& section) {
    out += ".SH \"" + std::string(section.title) + "\"\n";
    ForEachParagraph(section.text, [&](std::string_view paragraph) {
        if (IsVerbatim(paragraph))
            out += ".PP\n.nf\n" + Roff(paragraph) + "\n.fi\n";
        else
            out += ".PP\n" + Roff(paragraph) + '\n';
    });
}

}  // namespace

const char* UsageText() {
    static const std::string text = [] {
        std::string out = "Usage: " + std::string(kSynopsis) + "\n";
        AppendHelpSection(out, kDescription);
        out += "\nOptions:\n";
        for (const OptionSpec& spec : OptionTable()) {
            std::string forms = OptionForms(spec, false);
            if (forms.size() + 2 > kHelpColumn) {  // too long to share a line with its help
                out += forms + '\n';
                forms.clear();
            }
            out += forms + std::string(kHelpColumn - forms.size(), ' ');
            Flow(out, spec.help, kHelpColumn, kHelpColumn);
        }
        for (const Section& section : kSections) {
            if (!section.helpTitle) continue;
            out += '\n';
            AppendHelpSection(out, section);
        }
        return out;
    }();
    return text.c_str();
}

std::string ManualPage(const std::string& version) {
    // Left-aligned and not hyphenated: option names and file names must read as they are typed.
    std::string out = ".TH OVMACRO 1 \"\" \"ovmacro " + version + "\" \"User Commands\"\n.nh\n.ad l\n";
    out += ".SH NAME\novmacro \\- " + std::string(kSummary) + "\n";
    out += ".SH SYNOPSIS\n.B ovmacro\n[\\fIOPTIONS\\fR] [\\fIFILE\\fR]\n";
    AppendManualSection(out, kDescription);
    out += ".SH OPTIONS\n";
    for (const OptionSpec& spec : OptionTable())
        out += ".TP\n" + OptionForms(spec, true) + "\n" + Roff(spec.help) + '\n';
    for (const Section& section : kSections) AppendManualSection(out, section);
    return out;
}

}  // namespace ovmacro_tool
