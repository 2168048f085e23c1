#pragma once

// Times the two sides of a figure in the same benchmark run, alternating
// between them batch by batch (and switching which side goes first each
// time), so that a change in the machine's load falls on both alike. Each
// repetition yields the two sides' times per operation as the counters
// "measured" and "baseline" (nanoseconds), from which the figure is formed.
//
// Times are the calling thread's CPU time: all the work measured runs on the
// calling thread (the driver is told to rasterise there too), and CPU time
// leaves out the moments another process holds the core.

#include <time.h>

#include <benchmark/benchmark.h>

namespace vibench {

inline double threadSeconds() {
    timespec now;
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return double(now.tv_sec) + double(now.tv_nsec) * 1e-9;
}

class PairedTimes {
public:
    explicit PairedTimes(benchmark::State& state) : mState(state), mMeasured(0.0), mBaseline(0.0), mPasses(0) {}

    // One iteration: `batch` operations of each side, in alternating order.
    template <typename Measured, typename Baseline>
    void pass(int batch, Measured measured, Baseline baseline) {
        double measuredTime;
        double baselineTime;
        if (mPasses % 2 == 0) {
            measuredTime = time(batch, measured);
            baselineTime = time(batch, baseline);
        } else {
            baselineTime = time(batch, baseline);
            measuredTime = time(batch, measured);
        }
        add(measuredTime, baselineTime, batch);
    }

    // For sides that need untimed work around them: the caller times them
    // itself (with threadSeconds()) and reports one pass here.
    void add(double measuredSeconds, double baselineSeconds, int operations) {
        mMeasured += measuredSeconds;
        mBaseline += baselineSeconds;
        mOperations += operations;
        ++mPasses;
        mState.SetIterationTime(measuredSeconds + baselineSeconds);
    }

    bool measuredFirst() const { return mPasses % 2 == 0; }

    // Publishes the counters; call after the loop.
    void finish() {
        if (mOperations == 0) return;
        mState.counters["measured"] = benchmark::Counter(mMeasured * 1e9 / double(mOperations));
        mState.counters["baseline"] = benchmark::Counter(mBaseline * 1e9 / double(mOperations));
        mState.counters["ratio"] = benchmark::Counter(mMeasured / mBaseline);
    }

private:
    template <typename Operation>
    static double time(int batch, Operation operation) {
        const double start = threadSeconds();
        for (int i = 0; i < batch; ++i) operation();
        benchmark::ClobberMemory();
        return threadSeconds() - start;
    }

    benchmark::State& mState;
    double mMeasured;
    double mBaseline;
    long mOperations = 0;
    long mPasses;
};

}  // namespace vibench
