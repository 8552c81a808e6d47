#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

// A piece of the file system: each path and what stands there. A file is its text, a link is "> "
// and its text, the constants are the rest. In paths, texts and printed lines "~/" is short for the
// program's own directory.
using tree = std::map<std::string, std::string>;
constexpr char absent[] = "(absent)";
constexpr char directory[] = "(directory)";
constexpr char pipe_file[] = "(pipe)";
std::string spelled_out(const std::string& text);
tree operator+(tree base, const tree& changes);

using lines = std::vector<std::string>;
lines operator+(lines first, const lines& second);

// How a run ended: its status and the lines of both outputs, without the program's name.
struct outcome {
  int status;  // 128 and the signal's number for a run that a signal ended
  lines printed;
};
// An expected line may leave out the error text, where that concerns no failed call.
::testing::AssertionResult ended(const outcome& actual, int status, const lines& expected);

// The throw-away root that every test works in, on the program's real paths. It is empty at the
// start of each test but for the directories that the program expects.
class sandbox : public ::testing::Test {
 protected:
  sandbox();
  static void clear();
  static void put(const tree& entries);  // with the parent directories
  static tree look();                    // all that is in /usr and /var

  // Calls `body` in a process of its own, ended by force after 20 seconds. The status is what
  // `body` returns or the number that it raises, `other_error` where it raises something else.
  static constexpr int other_error = 99;
  static outcome run(const std::function<int()>& body);
  // Runs the program, after `before` in its process.
  static outcome boot(const std::function<void()>& before = [] {});
};
