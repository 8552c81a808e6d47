// icu_clock SECONDS: prints ICU's clock at that moment, given since 1970, the local zone, and the
// release of the time zone data. A client for tools/demo and tools/boot.
#include <unicode/smpdtfmt.h>
#include <unicode/timezone.h>

#include <cstdlib>
#include <iostream>
#include <string>

int main(int argc, char** argv) {
  const UDate moment = argc == 2 ? std::atof(argv[1]) * U_MILLIS_PER_SECOND : 0;
  UErrorCode error = U_ZERO_ERROR;
  const icu::SimpleDateFormat format("HH:mm VV", icu::Locale::getUS(), error);
  const char* const release = icu::TimeZone::getTZDataVersion(error);
  if (U_FAILURE(error)) return EXIT_FAILURE;
  icu::UnicodeString text;
  std::string clock;
  std::cout << format.format(moment, text).toUTF8String(clock) << ' ' << release << '\n';
  return EXIT_SUCCESS;
}
