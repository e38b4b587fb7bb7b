// Runs the tests against the library that is loaded. KASTARRI_EXPECT_TARGET names the target that it
// must run; where the processor cannot, the run counts as skipped.
//
// The tests run in a child process: an intrinsic may end the program (an unaligned address, a port without a
// handler) or crash it. The parent then names the test that was running and has another child run those after it.
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "kastarri.h"

namespace {

// What the child has told when it ends.
struct Progress {
  char running[200];  // the test's name, as a filter takes it; empty before the first
  bool finished;
};

class Reporter : public testing::EmptyTestEventListener {
 public:
  explicit Reporter(Progress& progress) : progress_(progress) {}
  void OnTestStart(const testing::TestInfo& test) override {
    std::snprintf(progress_.running, sizeof progress_.running, "%s.%s", test.test_suite_name(), test.name());
  }

 private:
  Progress& progress_;
};

// Takes the tests up to the named one, in the order in which they run, out of those that are to run.
void skip_through(const std::string& last) {
  std::string filter = GTEST_FLAG_GET(filter);
  filter += filter.find('-') == std::string::npos ? "-" : ":";
  const auto& tests = *testing::UnitTest::GetInstance();
  for (int i = 0; i < tests.total_test_suite_count(); ++i) {
    const auto& suite = *tests.GetTestSuite(i);
    for (int k = 0; k < suite.total_test_count(); ++k) {
      const std::string name = std::string(suite.name()) + '.' + suite.GetTestInfo(k)->name();
      filter += name + ':';
      if (name != last) continue;
      GTEST_FLAG_SET(filter, filter);
      return;
    }
  }
}

std::string ending(int status) {
  return WIFSIGNALED(status) ? "signal " + std::to_string(WTERMSIG(status))
                             : "exit status " + std::to_string(WEXITSTATUS(status));
}

// Runs what the filter says in a child. Returns how it ended.
int run_in_child(Progress& progress) {
  std::fflush(nullptr);
  const pid_t child = fork();
  if (child == 0) {
    testing::UnitTest::GetInstance()->listeners().Append(new Reporter(progress));
    const int result = RUN_ALL_TESTS();
    progress.finished = true;
    std::exit(result);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return status;
}

int run_all() {
  auto& progress = *static_cast<Progress*>(
      mmap(nullptr, sizeof(Progress), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0));
  std::vector<std::string> ended;
  bool failed = false;
  for (;;) {
    progress = {};
    const int status = run_in_child(progress);
    failed = failed || status != 0 || !progress.finished;
    if (progress.finished) break;
    ended.push_back(std::string("[  FAILED  ] ") + progress.running + " ended the program with " + ending(status));
    std::printf("%s\n", ended.back().c_str());
    if (progress.running[0] == '\0' || GTEST_FLAG_GET(fail_fast)) break;
    skip_through(progress.running);
  }
  if (!ended.empty()) std::printf("%zu tests ended the program:\n", ended.size());
  for (const std::string& line : ended) std::printf("%s\n", line.c_str());
  return failed;
}

}  // namespace

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  const char* expected = std::getenv("KASTARRI_EXPECT_TARGET");
  const char* target = cstub_Km_ZNB_Orbis_R5_64k_target();
  if (expected && std::strcmp(expected, target) != 0) {
    std::printf("this processor does not run %s\n", expected);
    return std::strcmp(target, "none") == 0 ? 77 : 1;
  }
  // A debugger that waits for a failure wants it in its own process.
  return GTEST_FLAG_GET(break_on_failure) ? RUN_ALL_TESTS() : run_all();
}
