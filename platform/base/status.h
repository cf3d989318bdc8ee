#pragma once

#include "platform/base/qx_string.h"

namespace Qx {

/// What kind of outcome an operation had, for a caller that acts on it. The sentence beside it is for people
/// only: nothing reads it to find out what happened.
enum class StatusCode {
    Ok,
    Failed,      ///< none of the kinds below; the sentence tells all there is to know
    NotFound,    ///< what was asked for is not there, for certain
    Locked,      ///< another process or thread has it; trying again later may help
    Damaged,     ///< it was read, and it is not whole or contradicts itself
    Newer,       ///< a later version of this program wrote it
    Refused,     ///< the system refused for a reason of its own, which `systemError` tells
    Full,        ///< there is no room left on the disk, or within the user's share of it
    ReadOnly,    ///< it may be looked at and not changed: a mark on it, or the file system it lies on
    Unsupported, ///< it is whole, but this program, or the form that is asked for, has no place for it
    BadArgument, ///< the caller asked for what cannot be done, whatever the state of the disk
    Cancelled    ///< it was interrupted on request, or its project is being left
};

/// The outcome of an operation that can fail for a reason its caller may want to act on or show. A failure
/// carries its kind, one sentence that names the thing, the place and, where there is one, the remedy, and
/// the system's error number where the system refused. A plain value.
class [[nodiscard]] Status {
public:
    /// Success.
    Status() = default;
    [[nodiscard]] static Status failure(String reason) {
        return failure(StatusCode::Failed, std::move(reason));
    }
    /// A failure of a kind; `Ok` counts as `Failed`. `systemError` is an `errno`, 0 for none.
    [[nodiscard]] static Status failure(StatusCode code, String reason, int systemError = 0) {
        Status status;
        status.m_code = code == StatusCode::Ok ? StatusCode::Failed : code;
        status.m_systemError = systemError;
        status.m_reason = std::move(reason);
        return status;
    }
    /// The same failure, told in another sentence. A success stays one.
    [[nodiscard]] Status retold(String reason) const {
        return isOk() ? Status() : failure(m_code, std::move(reason), m_systemError);
    }

    [[nodiscard]] bool isOk() const { return m_code == StatusCode::Ok; }
    explicit operator bool() const { return isOk(); }
    [[nodiscard]] StatusCode code() const { return m_code; }
    /// The system's error number (`errno`) of a failure that the system caused; else 0.
    [[nodiscard]] int systemError() const { return m_systemError; }
    /// Why it failed; empty on success.
    [[nodiscard]] const String& reason() const& { return m_reason; }
    [[nodiscard]] String reason() && { return std::move(m_reason); }

private:
    StatusCode m_code = StatusCode::Ok;
    int m_systemError = 0;
    String m_reason;
};

} // namespace Qx
