#include "util/version.h"

#include <err.h>

#include <regex>
#include <stdexcept>
#include <tuple>

#include "util/pattern.h"

namespace {

const olm_pattern& version_pattern() {
  static const olm_pattern pattern =
      compile_pattern(R"(([0-9]+)([a-z]+)(?:\.([0-9]+))?(?:\.([0-9]+))?)");
  return pattern;
}

std::int32_t number_or_absent(const std::ssub_match& digits) {
  return digits.matched ? std::stoi(digits) : olm_version::absent;
}

// What versions are compared by, in this order.
auto ordering_key(const olm_version& v) { return std::tie(v.year, v.letters, v.major, v.minor); }

}  // namespace

olm_version::olm_version(const std::string& text) { parse(text); }

void olm_version::parse(const std::string& text) {
  try {
    std::smatch results;
    if (!std::regex_match(text, results, version_pattern())) {
      warn("Cannot parse version string %s, results.size() = %d", text.c_str(),
           static_cast<int>(results.size()));
      throw std::invalid_argument("no match");
    }
    year = std::stoi(results[1]);
    letters = results[2];
    major = number_or_absent(results[3]);
    minor = number_or_absent(results[4]);
  } catch (const std::invalid_argument&) {
    warn("Cannot parse version string %s", text.c_str());
    *this = olm_version();
  }
}

bool operator>(const olm_version& a, const olm_version& b) {
  return ordering_key(a) > ordering_key(b);
}

bool operator==(const olm_version& a, const olm_version& b) {
  return ordering_key(a) == ordering_key(b);
}
