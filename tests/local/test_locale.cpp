// Puts the executable under the locale named by TEST_LOCALE: LANG and LC_ALL
// are set before any test runs, so the library's first detection sees them.
#include <cstdlib>

namespace {
struct UseTestLocale {
    UseTestLocale() {
        setenv("LANG", TEST_LOCALE, 1);
        setenv("LC_ALL", TEST_LOCALE, 1);
    }
} useTestLocale;
}  // namespace
