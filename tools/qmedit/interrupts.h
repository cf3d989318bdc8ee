#pragma once

/// What SIGINT, SIGTERM and SIGHUP do to a command. Until it comes to change files it ends at once, with one
/// line on standard error. What has begun to change files is not torn: the signal is noted, the work is
/// finished or taken back, and the command ends then. The exit code is 128 and the signal's number either
/// way. A signal that was ignored when the program was started stays ignored.
namespace interrupts {

/// Begins to catch the signals.
void install();

/// While one lives, on the main thread, signals are only noted. One may live inside another.
class Hold {
public:
    /// `changesEdits` is false for work that changes no edit of the project, whatever becomes of it.
    explicit Hold(bool changesEdits);
    ~Hold();
    Hold(const Hold&) = delete;
    Hold& operator=(const Hold&) = delete;

private:
    bool m_changesEdits;
};

/// True once a signal was noted: long work that can still be taken back asks between its steps.
[[nodiscard]] bool noted();

/// True once a `Hold` for work that changes edits is over.
[[nodiscard]] bool editsWereChanged();

/// What the command answers to the shell: `code`, or for a command that a signal was to end, after a line
/// that says so, the code of the signal.
[[nodiscard]] int exitCode(int code);

} // namespace interrupts
