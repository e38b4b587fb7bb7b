// Changes the volume of a stream of samples, twice: for the core, from its input queue to its output queue,
// and in plain C++.
//
// An entry of a queue is two 16-bit samples, the first in the low half. A sample becomes x * gain, where the
// gain has 12 bits behind the point, rounded half up and saturated to 16 bits.
#ifndef KASTARRI_EXAMPLES_PORTS_SCALE_H
#define KASTARRI_EXAMPLES_PORTS_SCALE_H

constexpr int GAIN_BITS = 12;

// The core's side. The gain is what the imported wire says at the start; the exported state counts the entries
// that are done. Returns how often a queue was not ready: the blocking version leaves the waiting to the host.
unsigned scale_blocking(int entries);
unsigned scale_polling(int entries);

void scale_reference(const short* x, int gain, short* y, int count);

#endif
