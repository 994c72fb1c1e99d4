# SPDX-License-Identifier: Apache-2.0
# The commands of this project; CMake and its presets do the work.

JOBS ?= $(shell nproc)
# Recordings made of the sounds of Debian packages: one for tests and benches, and one for `make run`, with sounds
# of the detector's classes.
CLIP := build/host/clip.wav
DEMO := build/host/demo.wav
# 29 minutes: the first repeated, its loudness changing in another rhythm.
LONG := build/host/long.wav
AUDIO ?= $(DEMO)

# Which kernels were compared with their references, out of a log of CTest.
SHOW_COMPARISONS := grep -E '^[0-9]+ comparisons: |not compared: |^[0-9]+ variants of [0-9]+ kernels '
# Inputs of this build that the user named once and that CMake has kept since.
SHOW_OWN_INPUTS := sed -nE 's/^(QZ_(WEIGHTS|LABELS|DETECTION_TABLES)):[A-Z]+=(.+)/This build keeps \1=\3, named \
earlier; cmake --preset host -U \1 returns to ours/p' build/host/CMakeCache.txt

# Each build is parallel; two installations of packages at a time would wait for each other's lock.
.NOTPARALLEL:

.PHONY: help run check test bench bench-baselines counts footprint kernel-gains lint setup clean configure-host \
        build-host build-target build-trainer clip demo train cross-validate

help:
	@echo 'make run               build, then run the detector on a clip of real sounds, all five scores shown'
	@echo 'make run AUDIO=FILE    the same on a sound file of your own'
	@echo 'make check             in seconds: format, lint what changed since main, run the unit tests'
	@echo 'make test              build and test for this PC, for the device, and with sanitizers'
	@echo 'make train DATA=FOLDER make the demonstration model again; compare with the committed one'
	@echo 'make cross-validate DATA=FOLDER   measure its recipe on recordings that were not trained on'
	@echo 'make bench             time the kernels, the graphs and the whole program'
	@echo 'make bench-baselines BASELINES=FOLDER   time this project and other libraries, in one table'
	@echo 'make counts            count instructions on this PC; compare with bench/instruction_counts.txt'
	@echo 'make footprint         measure bytes, stack and instructions; compare with docs/footprint.md'
	@echo 'make kernel-gains      what each kernel costs: its reference implementation and its variants'
	@echo 'make lint              check formatting and the rules of clang-tidy'
	@echo 'make setup             install the Debian packages for all this that are missing'
	@echo 'make clean             remove everything that was built'

setup:
	@scripts/setup-debian.sh

configure-host:
	@scripts/setup-debian.sh build test
	cmake --preset host

build-host: configure-host
	cmake --build --preset host --parallel $(JOBS)

# For the device, AArch32 with NEON; what is built runs under qemu-arm.
build-target:
	@scripts/setup-debian.sh target
	@scripts/make-sysroot.sh build/sysroot-armhf
	cmake --preset target
	cmake --build --preset target --parallel $(JOBS)

# What plays and trains, without tests: GoogleTest and Benchmark are not needed. A build that has tests keeps them.
run: $(if $(filter $(DEMO),$(AUDIO)),demo)
	@scripts/setup-debian.sh build
	cmake --preset host -DBUILD_TESTING=$(if $(shell grep -s '^BUILD_TESTING:BOOL=ON' build/host/CMakeCache.txt),ON,OFF)
	cmake --build --preset host --parallel $(JOBS) --target qz qz_train qz_trace
	@$(if $(filter $(DEMO),$(AUDIO)),cat $(DEMO:.wav=.txt))
	@$(SHOW_OWN_INPUTS)
	build/host/bin/qz run --scores "$(AUDIO)"

clip:
	@scripts/setup-debian.sh clip
	@test -e $(CLIP) || scripts/make-clip.sh $(CLIP)
	@test $(LONG) -nt $(CLIP) || sox -D $(CLIP) $(LONG) rate 16000 channels 1 repeat - trim 0 29:00 tremolo 0.1 95

demo:
	@scripts/setup-debian.sh demo
	@test $(DEMO) -nt scripts/make-demo-clip.sh || scripts/make-demo-clip.sh $(DEMO) >/dev/null

test: build-host build-target clip
	ctest --preset host
ifeq ($(shell uname -m),x86_64)
	@$(SHOW_COMPARISONS) build/host/Testing/Temporary/LastTest.log
	ctest --preset host-without-avx2
endif
	ctest --preset target
	@$(SHOW_COMPARISONS) build/target/Testing/Temporary/LastTest.log
	build/host/bin/qz prove $(CLIP) build/host build/target
	build/host/bin/qz prove $(LONG) build/host build/host/lib/qz-stream.so
	build/host/bin/qz prove $(LONG) build/host build/target/lib/qz-stream.so
	cmake --preset host-asan
	cmake --build --preset host-asan --parallel $(JOBS)
	ctest --preset host-asan
	cmake --preset other-detector
	cmake --build --preset other-detector --parallel $(JOBS)
	ctest --preset other-detector

# What a developer runs after every change, on a build with asserts.
check:
	@scripts/setup-debian.sh build test lint
	cmake --preset dev
	cmake --build --preset dev --parallel $(JOBS)
	ctest --preset dev
	scripts/lint.sh --changed build/dev

bench: build-host clip
	scripts/bench.sh

# The recordings that the demonstration model is trained on: a folder of class folders.
DATA ?=

build-trainer: configure-host
	@scripts/setup-debian.sh train
	cmake --build --preset host --parallel $(JOBS) --target qz qz_train

# UPDATE=1 replaces the committed model.
train: build-trainer
	UPDATE=$(UPDATE) scripts/train.sh "$(DATA)"

cross-validate: build-trainer
	@scripts/setup-debian.sh validation
	scripts/cross-validate.sh "$(DATA)"

# The programs that time other libraries are not part of this tree: BASELINES is their folder. UPDATE=1 rewrites
# docs/performance.md.
BASELINES ?= ../shared/peers
bench-baselines: build-host
	UPDATE=$(UPDATE) scripts/bench-baselines.sh $(BASELINES)

# UPDATE=1 replaces the committed counts.
counts: build-host
	@scripts/setup-debian.sh counts
	scripts/instruction-counts.py $(if $(UPDATE),--update)

# UPDATE=1 rewrites docs/footprint.md and the README's table.
footprint: configure-host build-target
	cmake --build --preset host --parallel $(JOBS) --target instruction_counter
	scripts/footprint/footprint.py $(if $(UPDATE),--update)

kernel-gains: configure-host build-target
	cmake --build --preset host --parallel $(JOBS) --target instruction_counter kernel_comparison_test
	scripts/kernel-gains.py
	@echo 'On this PC, nanoseconds: reference, reference compiled for AVX2, variant for AVX2, for AVX512-VNNI'
	build/host/bin/kernel_comparison_test --time

lint: build-host build-target
	@scripts/setup-debian.sh lint
	scripts/lint.sh build/host build/target

clean:
	rm -rf build
