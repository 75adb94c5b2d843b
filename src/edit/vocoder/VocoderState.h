#pragma once

#include <cstdint>
#include <mutex>
#include <vector>

namespace glimmet {

/// Per-bin memory of a vocoder routine, sized once by the first call.
///
/// Later calls may ask for bins the first call did not size (a larger FFT
/// length). Such a bin reads as 0 and a write to it lands in a spare slot
/// that is cleared before its next use, so a larger size can never reach
/// memory outside the array and never carries anything over.
class BinMemory {
public:
    void Allocate(int count) { values_.assign(size_t(count > 0 ? count : 0), 0.0f); }
    int Size() const { return int(values_.size()); }

    float& operator[](int bin)
    {
        if (bin >= 0 && bin < int(values_.size()))
            return values_[size_t(bin)];
        spare_ = 0.0f;
        return spare_;
    }

private:
    std::vector<float> values_;
    float spare_ = 0.0f;
};

/// What convert keeps between calls.
struct ConvertMemory {
    bool created = false;
    BinMemory lastPhase;
    float fundamental = 0.0f;
    float factor = 0.0f;
};

/// What unconvert keeps between calls.
struct UnconvertMemory {
    bool created = false;
    BinMemory phase;
    float fundamental = 0.0f;
    float factor = 0.0f;
};

/// What noscbank keeps between calls.
struct OscillatorMemory {
    static constexpr int kTableLength = 8192;

    bool created = false;
    BinMemory lastAmplitude;
    BinMemory lastFrequency;
    BinMemory index;
    std::vector<float> table;
    float inverseHop = 0.0f;
    float tableIncrement = 0.0f;
    int bins = 0;
};

/// The vocoder's memory: one per process, created by the first call of each
/// routine with that call's sizes and kept for the rest of the run, so that
/// phases and amplitudes carry over from channel to channel and from one
/// time stretch to the next.
///
/// Only one user at a time: a whole time stretch holds Lock() for its run,
/// and each routine takes it for its own call (the lock is recursive), so
/// two windows stretching at once take turns.
class VocoderState {
public:
    static VocoderState& Shared();

    std::recursive_mutex& Lock() { return lock_; }

    ConvertMemory convert;
    UnconvertMemory unconvert;
    OscillatorMemory oscillators;
    bool rfftCalled = false;

    /// Forgets everything, as if no routine had run yet. The program never
    /// does this; tests do, to start from a known state.
    void Reset();

private:
    VocoderState() = default;

    std::recursive_mutex lock_;
};

}  // namespace glimmet
