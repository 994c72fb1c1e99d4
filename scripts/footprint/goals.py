# SPDX-License-Identifier: Apache-2.0
"""The limits of sizes and costs, and where each comes from."""

import json
import pathlib

# (module, value): why it misses its limit, where that is known; any other that does is a failure.
MISSED = {}

# Network: a multiply-accumulate unit of 4 lanes that did nothing else would take 0.93 million.
RUN_INSTRUCTIONS = 1_750_000
FRAME_INSTRUCTIONS = 16_000
# One instruction a cycle, 24 hours a day.
CLOCK_KHZ = 4_500
CODE_BYTES = 40 * 1024
STACK_BYTES = 4 * 1024

# What the build made of the detector's description.
DETECTOR = json.loads(
    (pathlib.Path(__file__).resolve().parents[2] / "build/target/model/description.json").read_text())
CLASSES = DETECTOR["classes"]
INDIRECTION_ENTRIES = sum(operator["list_entries"] for operator in DETECTOR["operators"])

TABLE_BYTES = sum([
    DETECTOR["model_bytes"],  # packed weights of the network
    256,                      # its logistic table
    4 * INDIRECTION_ENTRIES,  # its lists of rows: an address or an offset each
    800 + 1536 + 997,         # front end: window, twiddles, filterbank
    48 + 258,                 # signal kernels: twiddles of 16 points, logarithm
    CLASSES * (4 + 8 + 1),    # detection: thresholds, cooling times, categories
    56 + 31,                  # info record, unstable ID
])
CONSTANTS_BYTES = TABLE_BYTES * 105 // 100  # and 5 % for strings, descriptors of messages and the like

# AppManager: the listener's table, the audio's flag and handle, 8 host clients and their count, the
# classifier (5 times, rings of 6 and 17 floats with two 16-bit counters, listener, flag), the list
# of client nanoapps; both held at multiples of 8.
CLASSIFIER_BYTES = (CLASSES * 8 + (4 + (DETECTOR["short_smoothing_runs"] + 1) * 4)
                    + (4 + (DETECTOR["long_smoothing_runs"] + 1) * 4) + 4 + 4 + 4)
APP_MANAGER_BYTES = (4 + 4 + 4 + 8 * 4 + 4) + CLASSIFIER_BYTES + 3 * 4 + 4

DATA_TABLE_BYTES = sum([
    DETECTOR["arena_bytes"], 2_896,  # arenas of the network and of the front end
    DETECTOR["window_bytes"], 2 * DETECTOR["frame_samples"],  # window of features, frame of samples
    4 + 4,              # their counters
    DETECTOR["feature_channels"] * 4 + 1,         # noise estimates, and whether they are set
    APP_MANAGER_BYTES, 1,
    2 * (4 + 1),        # the two audio functions: address, whether looked up
])
DATA_BYTES = DATA_TABLE_BYTES * 102 // 100  # and 2 % for alignment and reading ahead

# Of the network over a stream, as it was planned and tried out.
LIMITS = {
    "window": {
        "Instructions a run of the network": RUN_INSTRUCTIONS,
        "Instructions a frame of the front end": FRAME_INSTRUCTIONS,
        "Clock for always-on use, kHz": CLOCK_KHZ,
        "Code, bytes": CODE_BYTES,
        "Constants, bytes": CONSTANTS_BYTES,
        "Changing and zero data, bytes": DATA_BYTES,
        "Stack of nanoappHandleEvent, bytes": STACK_BYTES,
    },
    "stream": {
        "Instructions a run of the network": 260_000,
        "Instructions of the network with one frame, at most": 80_000,
        "Instructions a frame of the front end": 12_500,
        "Instructions of an audio event, at most": 3_600_000,
        "Clock for always-on use, kHz": 1_750,
        "Code, bytes": 32_000,
        "Constants, bytes": 94_500,
        "Changing and zero data, bytes": 7_500,
        "Tables for the loader, bytes": 2_600,
        "Stack of nanoappHandleEvent, bytes": STACK_BYTES,
    },
}
