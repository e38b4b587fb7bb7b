// Loads and stores, by their rows.
#include "kastarri/tables.h"
#include "memory/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto SAME = [](Int lane) { return lane; };
template <int Bits>
constexpr auto SATURATE =
    [](Int lane) { return std::clamp<Int>(lane, -(Int{1} << (Bits - 1)), (Int{1} << (Bits - 1)) - 1); };
constexpr auto SATURATE8 = SATURATE<8>;
constexpr auto SATURATE16 = SATURATE<16>;

}  // namespace model

// By this name it goes first, while a child process that a store ends is still small.
#define KASTARRI_TEST_SUITE "memoryDeathTest"
#include "support/drivers_begin.h"

#undef KERNEL_a
#define KERNEL_a(OP, R, RULE, A) constexpr auto model_##OP = testing_support::memory_model<R, A>(model::RULE);
#define KERNEL_copy(OP, L) KERNEL_a(OP, L, SAME, L)
#define KERNEL_extend(OP, R, A) KERNEL_a(OP, R, SAME, A)
#define KERNEL_cut KERNEL_extend
#define KERNEL_store_where KERNEL_a
#define KERNEL_saturated(OP, R, A) KERNEL_a(OP, R, SATURATE<R::bits>, A)
#define KERNEL_saturated_where KERNEL_saturated
#define KERNEL_replicate(OP, R, E) KERNEL_a(OP, R, SAME, E)

#define TEST_load_I(NAME, F, V, M, K) testing_support::drive_load_I(NAME, model_##K, F)
#define TEST_load_I_T(NAME, F, V, M, P, K) testing_support::drive_load_I(NAME, model_##K, F)
#define TEST_load_IP(NAME, F, V, M, K) testing_support::drive_load_IP(NAME, model_##K, F)
#define TEST_load_IP_T(NAME, F, V, M, P, K) testing_support::drive_load_IP(NAME, model_##K, F)
#define TEST_load_IP_aligned(NAME, F, V, M, K)                                                  \
  testing_support::drive_load_IP(NAME, model_##K, F, testing_support::alignment_of(sizeof(M))); \
  testing_support::expect_failures(NAME, F)
#define TEST_load_IP_aligned_destination(NAME, F, V, M, K) \
  testing_support::drive_load_IP(NAME, model_##K, F);      \
  testing_support::expect_destination_failures(NAME, F)
#define TEST_store_I(NAME, F, V, M, K) testing_support::drive_store_I(NAME, model_##K, F)
#define TEST_store_I_T(NAME, F, V, M, P, K) testing_support::drive_store_I(NAME, model_##K, F)
#define TEST_store_IP(NAME, F, V, M, K) testing_support::drive_store_IP(NAME, model_##K, F)
#define TEST_store_IP_T(NAME, F, V, M, P, K) testing_support::drive_store_IP(NAME, model_##K, F)
#define TEST_store_I_aligned(NAME, F, V, M, K)                                                  \
  testing_support::drive_store_I(NAME, model_##K, F, testing_support::alignment_of(sizeof(M))); \
  testing_support::expect_failures(NAME, F)
#define TEST_store_IP_aligned(NAME, F, V, M, K)                                                  \
  testing_support::drive_store_IP(NAME, model_##K, F, testing_support::alignment_of(sizeof(M))); \
  testing_support::expect_failures(NAME, F)

#include "memory/elements.def"
#include "memory/predicates.def"
#include "memory/vectors.def"
#include "memory/widening.def"

#include "support/drivers_end.h"

// The two tables of byte masks are each other's complement, and entry k spreads the bits of k.
TEST(MemoryTables, SpreadBitsToBytes) {
  for (unsigned k = 0; k < 16; ++k) {
    for (unsigned byte = 0; byte < 4; ++byte)
      EXPECT_EQ(cstub_Km_ZNB_Orbis_R5_64k_table__rk_bytelane_lsb[k] >> 8 * byte & 0xFF, (k >> byte & 1) * 0xFF);
    EXPECT_EQ(cstub_Km_ZNB_Orbis_R5_64k_mask[k], ~cstub_Km_ZNB_Orbis_R5_64k_table__rk_bytelane_lsb[k]);
  }
}
