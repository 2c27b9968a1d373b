// Addresses in loaded texts as file, line and column.
#include "source_locator.h"

#include <algorithm>
#include <functional>

namespace ovmacro_tool {

SourceLocator::SourceLocator(const orvan::MpfwSourceFileList& files) {
    for (orvan::int64 i = 0; i < files.size(); ++i) {
        const orvan::MpfwSourceFile* f = files[i];
        auto known = std::find(names_.begin(), names_.end(), f->fileName);
        const int index = static_cast<int>(known - names_.begin());
        if (known == names_.end()) names_.push_back(f->fileName);
        texts_.push_back(Text{f->Text().view(), index, {}});
    }
}

const SourceLocator::Text* SourceLocator::TextHolding(const char* p) const {
    // std::less orders addresses in unrelated buffers too; the end of a text counts as inside it.
    const std::less<const char*> lt;
    for (Text& t : texts_) {
        const char* begin = t.text.data();
        if (!lt(p, begin) && !lt(begin + t.text.size(), p)) {
            if (t.lineStarts.empty()) {
                t.lineStarts.push_back(0);
                for (size_t i = 0; i < t.text.size(); ++i)
                    if (t.text[i] == '\n') t.lineStarts.push_back(i + 1);
            }
            return &t;
        }
    }
    return nullptr;
}

bool SourceLocator::HoldsCopyOf(const char* p, std::string_view text) const {
    const Text* t = p ? TextHolding(p) : nullptr;
    if (!t) return false;
    const size_t offset = static_cast<size_t>(p - t->text.data());
    return t->text.substr(offset, text.size()) == text;
}

std::optional<SourcePosition> SourceLocator::Locate(const char* p) const {
    if (!p) return std::nullopt;
    const Text* t = TextHolding(p);
    if (!t) return std::nullopt;
    const std::string_view text = t->text;
    const size_t offset = static_cast<size_t>(p - text.data());
    // The last line that begins at or before the offset.
    const auto next = std::upper_bound(t->lineStarts.begin(), t->lineStarts.end(), offset);
    const size_t lineIndex = static_cast<size_t>(next - t->lineStarts.begin()) - 1;
    const size_t lineStart = t->lineStarts[lineIndex];
    const size_t lineEnd = next == t->lineStarts.end() ? text.size() : *next - 1;
    SourcePosition at;
    at.file = t->file;
    at.line = static_cast<long long>(lineIndex) + 1;
    at.column = static_cast<long long>(offset - lineStart) + 1;
    at.lineText = text.substr(lineStart, lineEnd - lineStart);
    return at;
}

}  // namespace ovmacro_tool
