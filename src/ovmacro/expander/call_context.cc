#include "ovmacro/expander/call_context.h"

namespace orvan {

basic_xstring InvokingMacroLine(const LSMacroVariable& m, std::size_t count,
                                const std::function<void(xostream&, std::size_t)>& writeValue) {
    StringStream ss;
    ss << "\n    invoking macro " << m;
    if (count > 0) {
        ss << " with ";
        for (std::size_t i = 0; i < count; ++i) {
            if (i) ss << ", ";
            ss << m.GetArg(static_cast<int64>(i)).name << "=";
            writeValue(ss, i);
        }
    }
    return ss.GetString();
}

}  // namespace orvan
