#pragma once

#include <stdexcept>

#include "framework/common/Export.hpp"

namespace velkor::layers {

/// A write that was sent and not answered: it may have been made, or be made later. The source
/// reads the keys again and tells what it finds.
class VELKOR_EXPORT UnknownOutcome : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// The texts of the errors of an `EtcdSource`, each part of the interface. The cause follows those
/// that end in a blank.
namespace etcd_errors {

inline constexpr const char* notStarted = "etcd could not be read: ";
inline constexpr const char* notWritten = "etcd refused the write: ";
inline constexpr const char* unknownOutcome = "etcd has not said whether it has written: ";
inline constexpr const char* notReached = "the write was not sent: ";
inline constexpr const char* changedMeanwhile = "another has changed the key meanwhile";
inline constexpr const char* sourceEnded = "the source has ended";
inline constexpr const char* tooManyWaiting = "too many writes wait for the server";
inline constexpr const char* noEndpoint = "An etcd endpoint is needed.";
inline constexpr const char* badEndpoint = "Not an etcd endpoint: ";

}  // namespace etcd_errors

}  // namespace velkor::layers
