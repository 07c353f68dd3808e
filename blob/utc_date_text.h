#pragma once
// Seconds since 1970-01-01 00:00 UTC as "YYYY-MM-DDTHH:MM", computed by
// calendar arithmetic: no dependence on the time zone or the C library's
// time_t width.

#include <cstdint>
#include <optional>
#include <string>

namespace blob {

// Empty when the year falls outside 0000..9999, which four digits cannot show.
std::optional<std::string> utcDateText(std::int64_t seconds);

} // namespace blob
