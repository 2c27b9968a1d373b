// StringX: the substitution text of a macro. It keeps a view of the text it was given, never a copy, so that
// positions inside a macro body stay positions in the text that defined it and errors there name the
// definition's file and line. The text must outlive the holder.
#pragma once

#include "ovmacro/foundations/sub_string.h"

namespace orvan {

class StringX {
public:
    // `copy` is accepted for interface compatibility and must be false: the holder only ever keeps a view.
    void Set(BasicSubString text, bool copy) {
        (void)copy;
        text_ = text;
    }
    BasicSubString Get() const { return text_; }
    operator BasicSubString() const { return text_; }  // NOLINT: reads as the body text

private:
    BasicSubString text_;
};

}  // namespace orvan
