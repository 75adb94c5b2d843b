#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace glimmet::test {

/// One step of a random script: an operation and raw random numbers that
/// the runner reads against the document as it is when the step runs, so
/// any subsequence of a script is a script too (that is what shrinking a
/// failure relies on).
struct SoakStep {
    enum Op : uint8_t {
        Transform, Remove, Cut, Paste, Truncate, Copy, ForeignCopy, AddChannel, RemoveChannel, Move,
        HugeMove, Mute, Pan, Select, UndoRun, RedoRun, DeleteHistory, CurveEffect, Stretch, Redraw, Save,
        FailedSave, OpCount
    };
    Op op = Transform;
    /// The range is one of the absurd ones a user can type (-2^31,
    /// -1000000000, 2^31 - 1); only for transforms, curve effects and
    /// Truncate.
    bool huge = false;
    uint64_t r[4] = {0, 0, 0, 0};
};

struct SoakOptions {
    /// Out of 1000 transforms and truncates, how many get an absurd range.
    int hugePerMille = 0;
};

std::vector<SoakStep> GenerateSoakSteps(uint64_t seed, size_t count, const SoakOptions& options);

/// The outcome of running steps from a fresh document: the index of the
/// first step after which the document differed from the model (-1 when
/// none did), what differed, and what each step did.
struct SoakResult {
    long failedAt = -1;
    std::string difference;
    std::vector<std::string> log;
};

/// Runs steps on a document made from seed, comparing it with the model
/// after every step.
SoakResult RunSoakSteps(uint64_t seed, const std::vector<SoakStep>& steps);

/// The smallest failing list found by taking steps out while the failure
/// stays, within about seconds of work.
std::vector<SoakStep> ShrinkSoakSteps(uint64_t seed, std::vector<SoakStep> steps, double seconds);

}  // namespace glimmet::test
