// Runs the tests against the library that is loaded. KASTARRI_EXPECT_TARGET names the target that it
// must run; where the processor cannot, the run counts as skipped.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "kastarri/library.h"

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  const char* expected = std::getenv("KASTARRI_EXPECT_TARGET");
  const char* target = cstub_Km_ZNB_Orbis_R5_64k_target();
  if (expected && std::strcmp(expected, target) != 0) {
    std::printf("this processor does not run %s\n", expected);
    return std::strcmp(target, "none") == 0 ? 77 : 1;
  }
  return RUN_ALL_TESTS();
}
