// Kinds of row of the floating-point family: one line stands for the formats of an operation.
#ifndef KASTARRI_FLOAT_ROW_KINDS_H
#define KASTARRI_FLOAT_ROW_KINDS_H

// A scalar operation; _BOTH in half and in single precision, the scalar's type the first column.
#define SCALARFP(OP, SHAPE, ...) ENTRY(rk_zran_scalarfp_##OP, SHAPE, __VA_ARGS__)
#define SCALARFP_BOTH(OP, SHAPE, ...)          \
  SCALARFP(OP##_H, SHAPE, qv_f16, __VA_ARGS__) \
  SCALARFP(OP##_S, SHAPE, rkfloat, __VA_ARGS__)

// An operation on a vector of halves, a vector of singles, one half and one single: OPNXF16, OPN_2XF32,
// OPF16, OPF32, each with its semantic function of the form FORM.
#define FLOAT_KERNELS(OP, FORM)         \
  KERNEL(OP##NXF16, FORM, OP, f16x32)   \
  KERNEL(OP##N_2XF32, FORM, OP, f32x16) \
  KERNEL(OP##F16, FORM, OP, f16x1)      \
  KERNEL(OP##F32, FORM, OP, f32x1)
#define FLOAT_ROWS(OP, SHAPE)                         \
  ROW(OP##NXF16, SHAPE, qv_vecNxf16, OP##NXF16)       \
  ROW(OP##N_2XF32, SHAPE, qv_vecN_2xf32, OP##N_2XF32) \
  ROW(OP##F16, SHAPE, qv_f16, OP##F16)                \
  ROW(OP##F32, SHAPE, rkfloat, OP##F32)
#define FLOAT_ROWS_T(OP, SHAPE)                                  \
  ROW(OP##NXF16T, SHAPE, qv_vecNxf16, vboolN, OP##NXF16)         \
  ROW(OP##N_2XF32T, SHAPE, qv_vecN_2xf32, vboolN_2, OP##N_2XF32) \
  ROW(OP##F16T, SHAPE, qv_f16, vbool1, OP##F16)                  \
  ROW(OP##F32T, SHAPE, rkfloat, vbool1, OP##F32)

#define FLOAT_a(OP)          \
  FLOAT_KERNELS(OP, float_a) \
  FLOAT_ROWS(OP, a_r)
#define FLOAT_bits(OP)          \
  FLOAT_KERNELS(OP, float_bits) \
  FLOAT_ROWS(OP, a_r)           \
  FLOAT_ROWS_T(OP, a_r_T)
#define FLOAT_ab(OP)          \
  FLOAT_KERNELS(OP, float_ab) \
  FLOAT_ROWS(OP, ab_r)        \
  FLOAT_ROWS_T(OP, ab_r_T)
#define FLOAT_acc_ab(OP)                                                             \
  FLOAT_KERNELS(OP, float_abc)                                                       \
  ROW(OP##NXF16, acc_ab, qv_vecNxf16, qv_vecNxf16, qv_vecNxf16, OP##NXF16)           \
  ROW(OP##N_2XF32, acc_ab, qv_vecN_2xf32, qv_vecN_2xf32, qv_vecN_2xf32, OP##N_2XF32) \
  ROW(OP##F16, acc_ab, qv_f16, qv_f16, qv_f16, OP##F16)                              \
  ROW(OP##F32, acc_ab, rkfloat, rkfloat, rkfloat, OP##F32)                           \
  ROW(OP##NXF16T, acc_ab_T, qv_vecNxf16, qv_vecNxf16, vboolN, OP##NXF16)             \
  ROW(OP##N_2XF32T, acc_ab_T, qv_vecN_2xf32, qv_vecN_2xf32, vboolN_2, OP##N_2XF32)   \
  ROW(OP##F16T, acc_ab_T, qv_f16, qv_f16, vbool1, OP##F16)                           \
  ROW(OP##F32T, acc_ab_T, rkfloat, rkfloat, vbool1, OP##F32)
#define FLOAT_ab_p(OP)                                         \
  FLOAT_KERNELS(OP, float_ab_bits)                             \
  ROW(OP##NXF16, ab_p, vboolN, qv_vecNxf16, OP##NXF16)         \
  ROW(OP##N_2XF32, ab_p, vboolN_2, qv_vecN_2xf32, OP##N_2XF32) \
  ROW(OP##F16, ab_p, vbool1, qv_f16, OP##F16)                  \
  ROW(OP##F32, ab_p, vbool1, rkfloat, OP##F32)

#endif
