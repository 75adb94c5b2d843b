#include "SoakRunner.h"

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <sstream>
#include <string>

#include "SoakModel.h"
#include "SoakSession.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet::test {

std::vector<SoakStep> GenerateSoakSteps(uint64_t seed, size_t count, const SoakOptions& options)
{
    std::mt19937_64 random(seed);
    // Weights out of 100: mostly edits and undo runs, some channel work, a
    // save now and then (each one mixes and writes the whole document).
    static const int kWeights[SoakStep::OpCount] = {19, 6, 4, 10, 4, 5, 3, 3, 3, 5, 2, 2, 2, 3, 8, 7, 1, 7, 2, 2, 1,
        1};
    static_assert(SoakStep::OpCount == 22);
    std::vector<SoakStep> steps(count);
    for (SoakStep& step : steps) {
        int pick = int(random() % 100);
        int op = 0;
        while (op < SoakStep::OpCount - 1 && pick >= kWeights[op])
            pick -= kWeights[op++];
        step.op = SoakStep::Op(op);
        for (uint64_t& r : step.r)
            r = random();
        const bool ranged
            = step.op == SoakStep::Transform || step.op == SoakStep::Truncate || step.op == SoakStep::CurveEffect;
        step.huge = ranged && int(random() % 1000) < options.hugePerMille;
    }
    return steps;
}

SoakResult RunSoakSteps(uint64_t seed, const std::vector<SoakStep>& steps)
{
    SoakResult result;
    // The edits' complaints ("what the....?") and the stretch's reports on
    // the error channel are expected here by the thousand; kept off the
    // terminal so a failure's report stands out.
    DiagnosticsCapture quiet;
    DiagnosticsCapture quietErrors(Diagnostics::Channel::Error);
    SoakSession session(seed);
    std::string difference = session.Difference();
    if (!difference.empty()) {
        result.failedAt = 0;
        result.difference = "at the start: " + difference;
        return result;
    }
    for (size_t i = 0; i < steps.size(); i++) {
        try {
            result.log.push_back(session.Apply(steps[i]));
        } catch (const std::exception& error) {
            // The model's vectors or the document ran out of memory: a
            // failure of this step like any other, so that it shrinks.
            result.log.push_back("step (operation " + std::to_string(int(steps[i].op)) + (steps[i].huge ? ", huge" : "")
                + ") threw " + error.what());
            result.failedAt = long(i);
            result.difference = result.log.back();
            return result;
        }
        if (std::getenv("GLIMMET_SOAK_TRACE") != nullptr)
            std::fprintf(stderr, "%zu. [%lld] %s\n", i, (long long)session.Total(), result.log.back().c_str());
        difference = session.Difference();
        if (!difference.empty()) {
            result.failedAt = long(i);
            result.difference = difference;
            return result;
        }
    }
    return result;
}

std::vector<SoakStep> ShrinkSoakSteps(uint64_t seed, std::vector<SoakStep> steps, double seconds)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
    SoakResult first = RunSoakSteps(seed, steps);
    if (first.failedAt < 0)
        return steps;
    steps.resize(size_t(first.failedAt) + 1);
    // Take out chunks, halving their size, and keep every removal after
    // which some step still fails; the list is cut after that step.
    for (size_t chunk = steps.size() / 2; chunk >= 1; chunk /= 2) {
        bool removed = true;
        while (removed) {
            removed = false;
            for (size_t at = 0; at + chunk <= steps.size(); ) {
                if (std::chrono::steady_clock::now() > deadline)
                    return steps;
                std::vector<SoakStep> trial(steps.begin(), steps.begin() + long(at));
                trial.insert(trial.end(), steps.begin() + long(at + chunk), steps.end());
                const SoakResult outcome = RunSoakSteps(seed, trial);
                if (outcome.failedAt >= 0) {
                    trial.resize(size_t(outcome.failedAt) + 1);
                    steps = trial;
                    removed = true;
                } else {
                    at += chunk;
                }
            }
        }
        if (chunk == 1)
            break;
    }
    return steps;
}

}  // namespace glimmet::test
