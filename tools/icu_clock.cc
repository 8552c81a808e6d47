// icu_clock SECONDS: prints ICU's clock at that moment, given since 1970, and the release of its
// time zone data. The client of tools/demo.
#include <unicode/smpdtfmt.h>
#include <unicode/timezone.h>

#include <cstdlib>
#include <iostream>
#include <string>

int main(int argc, char** argv) {
  const UDate moment = argc == 2 ? std::atof(argv[1]) * U_MILLIS_PER_SECOND : 0;
  UErrorCode error = U_ZERO_ERROR;
  const icu::SimpleDateFormat format("yyyy-MM-dd HH:mm:ss zzz", icu::Locale::getUS(), error);
  const char* const release = icu::TimeZone::getTZDataVersion(error);
  if (U_FAILURE(error)) return EXIT_FAILURE;
  icu::UnicodeString text;
  std::string clock;
  std::cout << format.format(moment, text).toUTF8String(clock) << ", " << release << '\n';
  return EXIT_SUCCESS;
}
