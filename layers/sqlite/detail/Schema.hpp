#pragma once

#include <string>
#include <vector>

#include "layers/sqlite/detail/Connection.hpp"

namespace velkor::layers::detail {

/// The statements that lead from each version of the schema to the next, the first one from an
/// empty database. Their count is the newest version. Steps are appended and never changed, since
/// files that they have made exist.
const std::vector<std::string>& schemaSteps();

/// Makes sure that the database is one of ours, brings it to the newest version, and has it log
/// ahead, each commit on the disk when it returns. A database without any table becomes one of
/// ours. `steps` are those of `schemaSteps` but in tests.
///
/// Throws `std::runtime_error` with the cause and leaves the database as it is when it is one of
/// another program ("it is a database of another program"), of a newer version ("its schema 2 is
/// newer than 1, the newest that is known here"), damaged ("it is damaged: " and how), or can't be
/// changed.
void bringUpToDate(Connection& connection, const std::vector<std::string>& steps = schemaSteps());

}  // namespace velkor::layers::detail
