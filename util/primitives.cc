#include "util/primitives.h"

#include <err.h>
#include <unistd.h>

#include <array>
#include <cerrno>

namespace {

constexpr std::size_t longest_link_text = 1024;  // in bytes

}  // namespace

void throw_filesystem_error(filesystem_error error) {
  errno = error;
  throw error;
}

namespace primitive {

void remove(const std::string& path) {
  if (unlink(path.c_str()) == 0 || errno == ENOENT) return;
  const filesystem_error error = errno;
  warn("remove: could not remove %s", path.c_str());
  throw_filesystem_error(error);
}

bool exists(const std::string& path) noexcept { return access(path.c_str(), F_OK) == 0; }

std::string read_symlink(const std::string& path) {
  std::array<char, longest_link_text> text;
  const ssize_t length = readlink(path.c_str(), text.data(), text.size());
  if (length >= 0) return {text.data(), static_cast<std::size_t>(length)};
  if (errno == ENOENT) return {};
  const filesystem_error error = errno;
  warn("read_symlink: %s", path.c_str());
  throw_filesystem_error(error);
}

void create_symlink(const std::string& target, const std::string& link_path) {
  if (symlink(target.c_str(), link_path.c_str()) == 0) return;
  const filesystem_error error = errno;
  warn("create_symlink: from %s to %s", link_path.c_str(), target.c_str());
  throw_filesystem_error(error);
}

}  // namespace primitive
