#!/usr/bin/env bash
# What takes too long for the tests of plug-ins in processes of their own: isolation.sh [PRESET [COUNT]]
#   kills    slaves are killed at random moments of COUNT jobs of decoding and of encoding (by default 1000)
#   jobs     16 jobs at once, and COUNT in a row, with level memory and descriptors
#   faults   a plug-in commits every fault in every operation
#   damage   containers are cut off at 20 places and changed at random 100 times
#   speed    boxed decoding of sound and video compared with plain decoding
#   start    time from the start of a slave to its first answer, and what the dynamic loader takes of it
# The host must survive, and nothing of the slaves may be left. For a machine with nothing else to do.
# PARTS selects among them: PARTS="kills damage" scripts/isolation.sh
set -euo pipefail

cd "$(dirname "$0")/.."
preset=${1:-release}
count=${2:-1000}
parts=${PARTS:-kills jobs faults damage speed start}
bin=build/$preset/bin

wants() { [[ " $parts " == *" $1 "* ]]; }

targets=(isolation_tests)
if wants damage; then targets+=(plugins_tests); fi
if wants speed || wants start; then targets+=(sonora2_bench); fi
cmake --build --preset "$preset" --target "${targets[@]}"

if wants kills; then
    TONEWRIGHT_TEST_KILLS=$count TONEWRIGHT_TEST_END_SECONDS=1 "$bin/isolation_tests" \
        --gtest_filter='Boxed.SlavesMayBeKilledAtAnyMoment:Boxed.SlavesEndWithTheirHost'
fi
if wants jobs; then
    TONEWRIGHT_TEST_JOBS=$count "$bin/isolation_tests" --gtest_filter='Boxed.ManyJobs*'
fi
if wants faults; then
    TONEWRIGHT_TEST_ALL_FAULTS=1 "$bin/isolation_tests" --gtest_filter='Faults.*'
fi
if wants damage; then
    TONEWRIGHT_TEST_DAMAGE=1 "$bin/plugins_tests" --gtest_filter='*AvContainer*'
fi
if wants speed; then
    "$bin/sonora2_bench" --benchmark_filter='plain|boxed' --benchmark_repetitions=5 \
        --benchmark_report_aggregates_only=true
fi
if wants start; then
    "$bin/sonora2_bench" --benchmark_filter=startSlave --benchmark_repetitions=20 \
        --benchmark_report_aggregates_only=true
    # Ends at once, without arguments: what is left is the loading of the libraries.
    loaded=$(for _ in {1..20}; do
        start=${EPOCHREALTIME/./}
        "$bin/../lib/sonora2_slave" 2>/dev/null || true
        echo $((${EPOCHREALTIME/./} - start))
    done | sort -n | sed -n 10p)
    echo "loading the program and its libraries: $((loaded / 1000)).$(printf %03d $((loaded % 1000))) ms (median)"
fi
