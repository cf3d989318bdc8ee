#pragma once

#include "platform/base/export.h"

#include <cstdint>
#include <iosfwd>

class PStream;

/// One field of a record that has a text form, a line or two of a file, and a packed form.
class QM_API data_field {
public:
    virtual ~data_field();

    /// Reads the text form from where the file stands. False, with the field as it was, when the file does
    /// not hold one there.
    virtual bool read(std::ifstream* file) = 0;
    /// Appends the text form. False for a null file or one that refuses.
    virtual bool write(std::ofstream* file) const = 0;

    /// Appends the packed form.
    virtual void pack(PStream& stream) const = 0;
    /// Reads a packed form that was written with a revision. A revision that is 0 or from the future, and a
    /// value that the field cannot hold, put the stream into its error state; the field is then as it was.
    virtual void unpack(PStream& stream, unsigned revision) = 0;

protected:
    data_field() = default;
    data_field(const data_field&) = default;
    data_field(data_field&&) = default;
    data_field& operator=(const data_field&) = default;
    data_field& operator=(data_field&&) = default;
};
