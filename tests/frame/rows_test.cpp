// Every row of every table has a test.
#include "families.h"

#include <set>

#include "support/drivers.h"

namespace {

#define ENTRY(SYMBOL, SHAPE, ...) #SYMBOL,
#define HELPER(NAME, SHAPE, ...) #NAME,
#include "frame/rows.h"
const char* const rows[] = {
#include "rows.def"
#include "scalar_rows.def"
};
#include "frame/rows_end.h"

TEST(Rows, HaveATestEach) {
  std::set<std::string> tests;
  const auto& all = *testing::UnitTest::GetInstance();
  for (int i = 0; i < all.total_test_suite_count(); ++i) {
    const auto& suite = *all.GetTestSuite(i);
    for (int k = 0; k < suite.total_test_count(); ++k) tests.insert(suite.GetTestInfo(k)->name());
  }
  for (const char* row : rows) EXPECT_EQ(tests.count(testing_support::operation(row)), 1u) << row;
}

}  // namespace
