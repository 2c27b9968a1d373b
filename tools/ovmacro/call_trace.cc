// The --trace report of calls and blocks.
#include "call_trace.h"

#include <algorithm>
#include <cstdio>
#include <utility>

#include "ovmacro/output/expanded_output.h"
#include "ovmacro/vars/variable.h"

using namespace orvan;
using namespace std::string_view_literals;

namespace ovmacro_tool {

namespace {

constexpr size_t kNotShown = static_cast<size_t>(-1);

// What the stream under `output` holds; nothing for a stream that keeps nothing to read back.
const basic_xstring* Written(ExpandedOutput& output) {
    const auto* stream = dynamic_cast<const StringStream*>(output.GetStream());
    return stream ? &stream->str() : nullptr;
}

std::string Trimmed(BasicSubString text) {
    std::string_view s = text.view();
    while (!s.empty() && (s.front() == ' ' || s.front() == '\t' || s.front() == '\n')) s.remove_prefix(1);
    while (!s.empty() && (s.back() == ' ' || s.back() == '\t' || s.back() == '\n')) s.remove_suffix(1);
    return std::string(s);
}

}  // namespace

std::string ShownText(std::string_view text) {
    std::string shown;
    for (const char c : text) {
        if (shown.size() >= CallTrace::kShownBytes) {
            return shown + "...(" + std::to_string(text.size()) + " bytes)";
        }
        const unsigned char u = static_cast<unsigned char>(c);
        if (c == '\n') {
            shown += "\\n";
        } else if (c == '\t') {
            shown += "\\t";
        } else if (u < 0x20 || u == 0x7f) {
            char hex[8];
            std::snprintf(hex, sizeof hex, "\\x%02x", u);
            shown += hex;
        } else {
            shown += c;
        }
    }
    return shown;
}

bool CallTrace::Wanted(std::string_view name) const {
    return names_.empty() || std::find(names_.begin(), names_.end(), name) != names_.end();
}

void CallTrace::CallBegan(const LSMacroVariable& m, BasicSubString at,
                          std::span<const BasicSubString> arguments, ExpandedOutput& output) {
    Open open;
    // A binding (an argument or a loop name) has the frame it expands in; a defined macro has none.
    open.shown = m.GetContext() == nullptr && Wanted(m.GetName().view());
    if (open.shown) {
        open.at = at.begin();
        open.name = (m.IsPython() ? "python " : "") + m.GetName().GetString();
        for (int64 i = 0; i < m.GetNumArgs(); ++i) open.formals.push_back(m.GetArg(i).name.GetString());
        open.arguments = arguments;
        open.output = &output;
    }
    Begin(std::move(open));
}

void CallTrace::CallBound(std::span<LSVariable* const> bindings) {
    if (open_.empty() || !open_.back().shown) return;
    for (LSVariable* binding : bindings) {
        StringStream value;
        binding->WriteValue(value);
        open_.back().bound.push_back(value.GetString());
    }
}

void CallTrace::BlockBegan(std::string_view directive, BasicSubString at, BasicSubString name,
                           BasicSubString value, ExpandedOutput& output) {
    Open open;
    open.shown = Wanted(directive.substr(0, 5) == "@else"sv ? "@if"sv : directive);
    if (open.shown) {
        open.at = at.begin();
        open.name = directive;
        open.head = open.name;
        std::string shownValue = Trimmed(value);
        if (directive == "@for"sv) {
            open.head += " " + (name.empty() ? "" : name.GetString() + " = ") + ShownText(shownValue);
        } else if (directive != "@else"sv) {
            // A condition as written may keep its brackets.
            if (shownValue.size() >= 2 && shownValue.front() == '(' && shownValue.back() == ')')
                shownValue = shownValue.substr(1, shownValue.size() - 2);
            open.head += "(" + ShownText(shownValue) + ")";
        }
        open.output = &output;
    }
    Begin(std::move(open));
}

void CallTrace::Begin(Open open) {
    open.depth = open_.empty() ? 0 : open_.back().depth + open_.back().shown;
    if (open.shown) {
        WritePendingHeads();
        const basic_xstring* written = Written(*open.output);
        open.outputStart = written ? written->size() : kNotShown;
    }
    open_.push_back(std::move(open));
}

std::string CallTrace::Head(const Open& open) const {
    if (open.formals.empty()) return open.head.empty() ? open.name : open.head;
    std::string head = open.name + "(";
    for (size_t i = 0; i < open.formals.size(); ++i) {
        if (i) head += ", ";
        const std::string_view value = i < open.bound.size()       ? std::string_view(open.bound[i])
                                       : i < open.arguments.size() ? open.arguments[i].view()
                                                                   : std::string_view();
        head += open.formals[i] + "=" + ShownText(value);
    }
    return head + ")";
}

void CallTrace::WritePendingHeads() {
    // The heads below one that is out are out: only the innermost open calls are looked at.
    size_t first = open_.size();
    while (first > 0 && !(open_[first - 1].shown && open_[first - 1].printed)) --first;
    for (size_t i = first; i < open_.size(); ++i) {
        Open& open = open_[i];
        if (!open.shown) continue;
        WriteLine(open, Head(open));
        open.printed = true;
    }
}

void CallTrace::Ended(bool failed) {
    if (open_.empty()) return;
    // Off the stack first, so that the stack stays right when a line cannot be written.
    const Open open = std::move(open_.back());
    open_.pop_back();
    if (open.shown) {
        WritePendingHeads();
        const basic_xstring* written = Written(*open.output);
        std::string result = " -> (not shown)";
        if (failed)
            result = " failed";
        else if (written && open.outputStart != kNotShown && open.outputStart <= written->size())
            result = written->size() == open.outputStart
                         ? " -> (empty)"
                         : " -> " + ShownText(std::string_view(*written).substr(open.outputStart));
        WriteLine(open, (open.printed ? open.name : Head(open)) + result);
    }
}

void CallTrace::WriteLine(const Open& open, const std::string& text) {
    // Deep recursions would push the text far to the right: past kIndentedLevels the depth is a number.
    std::string indent(2 * std::min(open.depth, kIndentedLevels), ' ');
    if (open.depth > kIndentedLevels) indent += "[" + std::to_string(open.depth) + "] ";
    writer_.Write(open.at, "trace", indent + text, false);
}

}  // namespace ovmacro_tool
