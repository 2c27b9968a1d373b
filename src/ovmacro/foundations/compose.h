// Compose: builds a message from pieces with the stream's output operators.
//
//     throw LexScannerException(Compose("Repeated argument ", arg, " in definition of macro ", name), token);
#pragma once

#include "ovmacro/foundations/stream.h"

namespace orvan {

template <class... Pieces>
basic_xstring Compose(const Pieces&... pieces) {
    StringStream ss;
    (ss << ... << pieces);
    return ss.GetString();
}

}  // namespace orvan
