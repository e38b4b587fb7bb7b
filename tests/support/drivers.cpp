#include "support/drivers.h"

namespace testing_support {

void expect_image(const std::string& name, int round, const Format& format, const Int* expected, const void* got,
                  std::size_t bytes, const std::function<std::string(int)>& operands_of) {
  Image image = {};
  for (int i = 0; i < format.count; ++i) set_lane(format, image.bytes, i, expected[i]);
  if (std::memcmp(image.bytes, got, bytes) == 0) return;
  const std::string where = name + " [" + cstub_Km_ZNB_Orbis_R5_64k_target() + ", seed " + std::to_string(seed) +
                            ", round " + std::to_string(round) + "]";
  for (int i = 0; i < format.count; ++i) {
    const Int want = lane(format, image.bytes, i), have = lane(format, got, i);
    if (want != have) {
      FAIL() << where << " lane " << i << ": " << operands_of(i) << " expected " << want << ", got " << have;
    }
  }
  FAIL() << where << ": lanes are right, bits outside them are not";
}

void check(const Operation& operation) {
  OperandImages operands(operation.operands, operation.all_values);
  std::vector<Int> expected(static_cast<std::size_t>(operation.result.count));
  std::vector<Int> values(operation.operands.size());
  for (int n = 0; n < operands.rounds(); ++n) {
    const Image* images = operands.round(n);
    const auto read_lane = [&](int i) {
      for (std::size_t k = 0; k < values.size(); ++k) values[k] = lane(operation.operands[k], images[k].bytes, i);
    };
    for (int i = 0; i < operation.result.count; ++i) {
      read_lane(i);
      expected[static_cast<std::size_t>(i)] = operation.rule(values.data());
    }
    operation.adjust(n, expected.data());
    Image result;
    const std::size_t bytes = operation.call(images, result.bytes);
    expect_image(operation.name, n, operation.result, expected.data(), result.bytes, bytes, [&](int i) {
      read_lane(i);
      std::string text;
      for (Int value : values) text += (text.empty() ? "(" : ", ") + std::to_string(value);
      return text + ")";
    });
    if (testing::Test::HasFatalFailure()) return;
  }
}

const char* operation(const char* symbol) {
  const char* found = std::strstr(symbol, "_ZRA_");
  return found ? found + 5 : symbol;
}

int add_test(const char* suite, const char* name, std::function<void()> body) {
  class Row : public testing::Test {
   public:
    explicit Row(std::function<void()> body) : body_(std::move(body)) {}
    void TestBody() override { body_(); }

   private:
    std::function<void()> body_;
  };
  testing::RegisterTest(suite, name, nullptr, nullptr, __FILE__, __LINE__,
                        [body = std::move(body)]() -> testing::Test* { return new Row(body); });
  return 0;
}

}  // namespace testing_support
