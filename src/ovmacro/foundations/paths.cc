#include "ovmacro/foundations/paths.h"

#include <string_view>

namespace orvan {

namespace {

xvector<std::string_view> SplitSegments(std::string_view path) {
    xvector<std::string_view> segments;
    size_t i = 0;
    while (i < path.size()) {
        while (i < path.size() && path[i] == '/') ++i;
        const size_t start = i;
        while (i < path.size() && path[i] != '/') ++i;
        if (i > start) segments.push_back(path.substr(start, i - start));
    }
    return segments;
}

}  // namespace

void NormalisePath(basic_xstring& path) {
    for (char& c : path)
        if (c == '\\') c = '/';
    const bool absolute = !path.empty() && path[0] == '/';
    xvector<std::string_view> kept;
    for (std::string_view seg : SplitSegments(path)) {
        if (seg == ".") continue;
        if (seg == ".." && !kept.empty() && kept.back() != "..") {
            kept.pop_back();
            continue;
        }
        if (seg == ".." && absolute) continue;  // nothing lies above the root
        kept.push_back(seg);
    }
    basic_xstring out;
    out.reserve(path.size());
    if (absolute) out += '/';
    for (size_t i = 0; i < kept.size(); ++i) {
        if (i) out += '/';
        out.append(kept[i]);
    }
    if (out.empty()) out = ".";
    path.swap(out);
}

void CalcRelativePath(const basic_xstring& first, const basic_xstring& second, basic_xstring& result) {
    const bool firstAbsolute = !first.empty() && first[0] == '/';
    const bool secondAbsolute = !second.empty() && second[0] == '/';
    if (firstAbsolute != secondAbsolute) {
        result = second;
        return;
    }
    xvector<std::string_view> from = SplitSegments(first);
    xvector<std::string_view> to = SplitSegments(second);
    if (from.size() == 1 && from[0] == ".") from.clear();
    if (to.size() == 1 && to[0] == ".") to.clear();
    size_t common = 0;
    while (common < from.size() && common < to.size() && from[common] == to[common]) ++common;
    basic_xstring out;
    for (size_t i = common; i < from.size(); ++i) {
        if (!out.empty()) out += '/';
        out += "..";
    }
    for (size_t i = common; i < to.size(); ++i) {
        if (!out.empty()) out += '/';
        out.append(to[i]);
    }
    if (out.empty()) out = ".";
    result.swap(out);
}

}  // namespace orvan
