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
std::string spelled_out(std::string text);
tree operator+(tree base, const tree& changes);

// What a run printed, without the program's name and the error text; then, unless that is 0,
// "status" and its status, the number that it raised, or 128 and that of the signal that ended it.
using lines = std::vector<std::string>;
lines operator+(lines first, const lines& second);

// The throw-away root that every test works in, on the program's real paths. It is empty at the
// start of each test but for the directories that the program expects.
class sandbox : public ::testing::Test {
 protected:
  sandbox();
  static void clear();
  static void put(const tree& entries);  // with the parent directories
  static tree look();                    // all that is in /usr and /var

  // Calls `body` in a process of its own, ended by force after two minutes.
  static lines run(const std::function<int()>& body);
  // Runs the program, after `before` in its process.
  static lines boot(const std::function<void()>& before = [] {});
};
