#pragma once

namespace glimmet {

/// Makes one step of writing a file fail with a chosen errno, the way a full
/// disk, a read-only mount or a failing disk would make it fail. Tests use it
/// to check what a failed save leaves behind, since such disks cannot be
/// staged where they run (as root, without mounting anything).
///
/// Process-wide; safe to read from any thread.
class WriteFaults {
public:
    enum class Step { Create, Write, Sync, Rename, kCount };

    /// From now on, every call of step fails with error (0 lets it work).
    static void Inject(Step step, int error);
    /// Lets every step work again.
    static void Clear();
    /// The errno step is to fail with, or 0.
    static int ErrorFor(Step step);
};

/// Injects a failure for the lifetime of a scope.
class ScopedWriteFault {
public:
    ScopedWriteFault(WriteFaults::Step step, int error) { WriteFaults::Inject(step, error); }
    ~ScopedWriteFault() { WriteFaults::Clear(); }
    ScopedWriteFault(const ScopedWriteFault&) = delete;
    ScopedWriteFault& operator=(const ScopedWriteFault&) = delete;
};

}  // namespace glimmet
