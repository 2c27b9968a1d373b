// Advice to the kernel about the large buffers that whole texts live in.
#pragma once

#include <algorithm>
#include <cstddef>

namespace orvan {

// Asks for transparent huge pages over the whole 2 MiB pages inside [p, p + n), when `n` is large enough to
// be worth it. A 40 MB text then costs twenty page faults instead of ten thousand. Call it before the buffer
// is first written. Only advice: it changes nothing a program can observe but speed.
void AdviseLargeBuffer(const void* p, std::size_t n);

// Makes room for `needed` elements in a string or vector, growing it geometrically as the containers
// themselves do; a large new buffer is advised before the old content is copied into it.
template <class Buffer>
void ReserveLargeBuffer(Buffer& b, std::size_t needed) {
    if (needed <= b.capacity()) return;
    Buffer bigger;
    bigger.reserve(std::max(needed, b.capacity() * 2));
    AdviseLargeBuffer(bigger.data(), bigger.capacity() * sizeof(*bigger.data()));
    bigger.insert(bigger.end(), b.begin(), b.end());
    b.swap(bigger);
}

}  // namespace orvan
