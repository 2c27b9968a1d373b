#include "ovmacro/foundations/sub_string.h"

namespace orvan {

int strcmp(BasicSubString a, BasicSubString b) {
    const int c = a.view().compare(b.view());
    return c < 0 ? -1 : (c > 0 ? 1 : 0);
}

int strcmp(BasicSubString a, const char* b) { return strcmp(a, BasicSubString(b)); }

bool CaseInsensitiveCompare(BasicSubString a, BasicSubString b) {
    if (a.size() != b.size()) return false;
    for (int64 i = 0; i < a.size(); ++i) {
        unsigned char x = static_cast<unsigned char>(a[i]);
        unsigned char y = static_cast<unsigned char>(b[i]);
        if (x >= 'A' && x <= 'Z') x = static_cast<unsigned char>(x - 'A' + 'a');
        if (y >= 'A' && y <= 'Z') y = static_cast<unsigned char>(y - 'A' + 'a');
        if (x != y) return false;
    }
    return true;
}

}  // namespace orvan
