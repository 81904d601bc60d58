#pragma once

/// What the processes of the fleet are told, a byte each. They answer with the same byte when it is
/// done, `tellValues` with the values of all settings.
namespace velkor::benchmarks::commands {

inline constexpr char ready = 'R';  ///< Said by the process.
inline constexpr char fill = 'f';
inline constexpr char beginWriting = 'w';
inline constexpr char endWriting = 's';
inline constexpr char tellValues = 'v';
inline constexpr char end = 'e';

}  // namespace velkor::benchmarks::commands
