// y[i] = (c[i] + a[i] * b[i]) * gain[i % 16], the sum rounded once; `samples` is a multiple of 16.
#ifndef KASTARRI_BENCH_STATIC_FLOATS_H
#define KASTARRI_BENCH_STATIC_FLOATS_H

void multiply_add_multiply(const float* a, const float* b, const float* c, const float* gain, float* y, int samples);

#endif
