// A directory of one's own and programs run in it.
#ifndef KASTARRI_TESTS_EXAMPLES_SUPPORT_H
#define KASTARRI_TESTS_EXAMPLES_SUPPORT_H

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <set>
#include <stdexcept>
#include <string>

#include <sys/wait.h>

#include "common/files.h"

// A new empty directory, gone with the object.
class Directory {
 public:
  Directory() {
    path_ = std::filesystem::temp_directory_path() / "kastarri-examples-XXXXXX";
    if (!::mkdtemp(path_.data())) throw std::runtime_error("cannot make " + path_);
  }
  Directory(const Directory&) = delete;
  ~Directory() { std::filesystem::remove_all(path_); }
  std::string file(const std::string& name) const { return path_ + "/" + name; }
  std::set<std::string> names() const {
    std::set<std::string> all;
    for (const auto& entry : std::filesystem::directory_iterator(path_)) all.insert(entry.path().filename());
    return all;
  }
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

// Runs an example in the directory: its exit status and what it complains about, as in "0: ". Arguments are words
// for the shell.
inline std::string run_example(const Directory& directory, const std::string& name, const std::string& arguments) {
  const std::string command =
      "cd " + directory.path() + " && " EXAMPLE_PROGRAMS "/" + name + " " + arguments + " 2>&1 >/dev/null";
  std::FILE* const pipe = ::popen(command.c_str(), "r");
  if (!pipe) return "not run";
  std::string errors;
  char block[4096];
  while (const std::size_t got = std::fread(block, 1, sizeof block, pipe)) errors.append(block, got);
  const int status = ::pclose(pipe);
  return std::to_string(WIFEXITED(status) ? WEXITSTATUS(status) : -1) + ": " + errors;
}

// Expects that the function throws a Failure that says `what`.
template <class F>
void expect_complaint(F&& f, const std::string& what) {
  try {
    f();
    ADD_FAILURE() << "nothing said: " << what;
  } catch (const examples::Failure& failure) {
    EXPECT_NE(std::string(failure.what()).find(what), std::string::npos) << what << ": " << failure.what();
  }
}

#endif
