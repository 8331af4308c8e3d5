// Status values and the one table behind their messages. A status is read
// from the low 16 bits of a result, as a signed value.
//
// A new status is one line here: a named code if the library raises it, and
// a row in kStatusTable if it has a text (or is silent). The message lookup,
// the built-in string table and the tests all derive from the table.
#pragma once

#include <cstdint>

namespace tessarine {

inline constexpr int32_t kOk = 10;
inline constexpr int32_t kErrGeneral = -1;       // a general failure
inline constexpr int32_t kErrUnsupported = -2;   // a layout, colour model or image type not handled
inline constexpr int32_t kErrDegenerate = -3;    // a zero-length direction
inline constexpr int32_t kErrArgument = -4;      // a missing or unusable argument, an empty result
inline constexpr int32_t kErrMemory = -5;        // a failed allocation
inline constexpr int32_t kErrEmptyList = -6;     // removing from an empty list
inline constexpr int32_t kErrNoRealRoot = -7;    // a polynomial without a real root
inline constexpr int32_t kErrSelector = -14;     // a selector argument outside its values
inline constexpr int32_t kErrTooComplex = -21;   // a curve that needs more pieces than allowed
inline constexpr int32_t kErrCancelled = -18;    // the caller's progress callback said stop
inline constexpr int32_t kErrBudget = -29;       // a band that does not fit its memory budget
inline constexpr int32_t kErrTooLarge = -40;     // a file size past a signed 32-bit offset
inline constexpr int32_t kErrFileAccess = -50;   // a file that cannot be made or opened
inline constexpr int32_t kErrStackOverflow = -56;  // a subdivision past its bound

inline constexpr int16_t StatusOf(int32_t result) { return static_cast<int16_t>(result); }
inline constexpr bool Failed(int32_t result) { return StatusOf(result) < 0; }

// Markers in the table's status column that no 16-bit status can equal.
inline constexpr int32_t kAnyOtherStatus = INT32_MIN;  // the general text's row
inline constexpr int32_t kNoStatus = INT32_MAX;        // a text that no status reaches
// The text id of a silent status.
inline constexpr int32_t kNoText = 0;

struct StatusText {
    int32_t status;
    int32_t textId;    // kNoText: the status shows nothing
    const char *text;  // null for a silent status
};

// The ids do not run in the order of the codes (16415 sits at -23): the rows
// are the mapping, and no rule replaces them.
inline constexpr StatusText kStatusTable[] = {
    {kErrUnsupported, 16385, "Functionality not yet supported."},
    {kErrMemory, 16386, "Not enough memory."},
    {-8, 16387, "Open paths will not be processed."},
    {-9, 16388, "Option does not exist"},
    {-10, 16389, "No object found."},
    {-11, 16390, "Input number is too large."},
    {-12, 16391, "System database failed."},
    {-17, 16392, "Offset distance too large."},
    {kErrCancelled, kNoText, nullptr},
    {-20, 16393, "The gap is too big."},
    {-21, 16394, "Try a simpler case."},
    {-23, 16415, "Not enough memory to bitmap."},
    {-24, 16395, "Only one color will be processed."},
    {-25, 16396, "Input must be between 0% and 100%."},
    {-26, 16397, "Logic error detected, operation aborted."},
    {-28, 16398, "No object selected."},
    {-31, 16399, "Device not supported."},
    {-32, 16400, "Substrate not supported."},
    {-33, 16401, "Ink not supported."},
    {-34, kNoText, nullptr},
    {-35, 16402, "Only black and white image allowed."},
    {-36, 16403, "No image selected."},
    {-37, 16404, "Not enough memory to RIP."},
    {-38, 16405, "Not enough disk space."},
    {kErrFileAccess, 16406, "Failed to access bitmap."},
    {-52, 16407, "Object too small to print."},
    {-53, 16408, "Resource not found."},
    {-54, 16409, "Failed in doing rasterization."},
    {-55, 16410, "Failed to communicate with Jobyard."},
    {kErrStackOverflow, 16411, "Stack overflow."},
    {kAnyOtherStatus, 16384, "Error detected; operation aborted."},
    {kNoStatus, 16412, "Unexpected NULL pointer."},
    {kNoStatus, 16413, "Degenerated input."},
    {kNoStatus, 16414, "Wrong input."},
};

namespace status_table {

constexpr bool IsListed(const StatusText &row) {
    return row.status != kAnyOtherStatus && row.status != kNoStatus;
}
constexpr bool HasText(const StatusText &row) { return row.textId != kNoText; }
constexpr int32_t StatusOfRow(const StatusText &row) { return row.status; }
constexpr int32_t TextIdOfRow(const StatusText &row) { return row.textId; }

struct Span {
    int32_t low = INT32_MAX;
    int32_t high = INT32_MIN;
};

// The least and greatest `value` of the rows that `keep` accepts.
constexpr Span SpanOf(bool (*keep)(const StatusText &), int32_t (*value)(const StatusText &)) {
    Span span;
    for (const StatusText &row : kStatusTable) {
        if (!keep(row)) continue;
        if (value(row) < span.low) span.low = value(row);
        if (value(row) > span.high) span.high = value(row);
    }
    return span;
}

inline constexpr Span kListed = SpanOf(IsListed, StatusOfRow);
inline constexpr Span kTextIds = SpanOf(HasText, TextIdOfRow);

constexpr int32_t GeneralTextId() {
    for (const StatusText &row : kStatusTable)
        if (row.status == kAnyOtherStatus) return row.textId;
    return kNoText;
}

// Every id between the bounds has exactly one row with a text, and every
// listed status one row.
constexpr bool IsWellFormed() {
    for (int32_t id = kTextIds.low; id <= kTextIds.high; ++id) {
        int rows = 0;
        for (const StatusText &row : kStatusTable) rows += row.textId == id;
        if (rows != 1) return false;
    }
    for (const StatusText &row : kStatusTable) {
        if ((row.textId == kNoText) != (row.text == nullptr)) return false;
        if (!IsListed(row)) continue;
        if (row.status >= 0) return false;
        int rows = 0;
        for (const StatusText &other : kStatusTable) rows += other.status == row.status;
        if (rows != 1) return false;
    }
    return GeneralTextId() != kNoText;
}

}  // namespace status_table

// The statuses looked up in the table; the rest show the general text, and
// a status above 0 shows nothing.
inline constexpr int32_t kLowestListedStatus = status_table::kListed.low;
inline constexpr int32_t kHighestListedStatus = status_table::kListed.high;
// The built-in string table's ids.
inline constexpr int32_t kFirstTextId = status_table::kTextIds.low;
inline constexpr int32_t kLastTextId = status_table::kTextIds.high;
inline constexpr int32_t kGeneralTextId = status_table::GeneralTextId();

static_assert(status_table::IsWellFormed(), "one row per status and per text id, ids without gaps");

}  // namespace tessarine
