#pragma once

namespace velkor::settings {

/// The names of an enumeration, specialised by whoever has settings of it:
///
///     template <>
///     struct velkor::settings::EnumNames<Level> {
///         static constexpr std::pair<Level, std::string_view> table[] = {
///             {Level::debug, "debug"}, {Level::warning, "warning"}, {Level::warning, "warn"}};
///     };
///
/// A value may have several names; the first of them is shown. Names differ by more than the case
/// of ASCII letters, which is not told apart when one is read, and neither begin nor end with a
/// blank.
template <class Enum>
struct EnumNames;

}  // namespace velkor::settings
