// SPDX-License-Identifier: Apache-2.0
// The runtime as a nanoapp sees it: API 1.9, the subset that this nanoapp uses. Declarations only;
// a hub implements the functions, and a device vendor's own header of the same name can replace
// this one.
//
// The runtime calls a nanoapp's entry points and free callbacks on one thread, one at a time. Times
// are unsigned nanoseconds. Strings are NUL-terminated.
#ifndef QZ_PLATFORM_CHRE_H_
#define QZ_PLATFORM_CHRE_H_

#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#define CHRE_API_VERSION_1_9 UINT32_C(0x01090000)

// Logging.

enum chreLogLevel {
  CHRE_LOG_ERROR = 0,
  CHRE_LOG_WARN = 1,
  CHRE_LOG_INFO = 2,
  CHRE_LOG_DEBUG = 3,
};

// Writes one line, formatted as by printf.
void chreLog(enum chreLogLevel level, const char* format, ...)
    __attribute__((format(printf, 2, 3)));

// Heap.

// A block of at least `bytes` bytes, aligned for any type, or NULL.
void* chreHeapAlloc(uint32_t bytes);
// Gives a block back; NULL is allowed.
void chreHeapFree(void* pointer);

// Time.

// Nanoseconds on the hub's own clock, which never runs backwards.
uint64_t chreGetTime(void);
// What to add to chreGetTime() for the host's clock.
int64_t chreGetEstimatedHostTimeOffset(void);

// Events and messages that a nanoapp sends.

typedef void(chreEventCompleteFunction)(uint16_t eventType, void* eventData);
typedef void(chreMessageFreeFunction)(void* message, size_t messageSize);

// Queues an event for the nanoapp with instance ID `targetInstanceId`. The data belongs to the
// runtime until it calls `freeCallback`, exactly once: after delivery, or before returning false.
bool chreSendEvent(uint16_t eventType, void* eventData, chreEventCompleteFunction* freeCallback,
                   uint32_t targetInstanceId);

// Queues a message for a host endpoint. Ownership as for chreSendEvent; a message without a buffer
// may come without a callback.
bool chreSendMessageToHostEndpoint(void* message, size_t messageSize, uint32_t messageType,
                                   uint16_t hostEndpoint, chreMessageFreeFunction* freeCallback);

// Events that a nanoapp receives.

#define CHRE_EVENT_MESSAGE_FROM_HOST UINT16_C(0x0001)
#define CHRE_EVENT_NANOAPP_STARTED UINT16_C(0x0003)
#define CHRE_EVENT_NANOAPP_STOPPED UINT16_C(0x0004)
#define CHRE_EVENT_AUDIO_SAMPLING_CHANGE UINT16_C(0x0330)
#define CHRE_EVENT_AUDIO_DATA UINT16_C(0x0331)

// Data of CHRE_EVENT_MESSAGE_FROM_HOST. `message` may be NULL when `messageSize` is 0.
struct chreMessageFromHostData {
  uint32_t messageType;
  uint32_t messageSize;
  const void* message;
  uint16_t hostEndpoint;
};

// Data of CHRE_EVENT_NANOAPP_STARTED and CHRE_EVENT_NANOAPP_STOPPED.
struct chreNanoappInfo {
  uint64_t appId;
  uint32_t version;
  uint32_t instanceId;
};

// Audio.

enum chreAudioDataFormat {
  CHRE_AUDIO_DATA_FORMAT_8_BIT_U_LAW = 0,
  CHRE_AUDIO_DATA_FORMAT_16_BIT_SIGNED_PCM = 1,
};

struct chreAudioSource {
  const char* name;
  uint32_t sampleRate;         // Hz
  uint64_t minBufferDuration;  // ns
  uint64_t maxBufferDuration;  // ns
  uint8_t format;              // enum chreAudioDataFormat
};

struct chreAudioSourceStatus {
  bool enabled;
  bool suspended;
};

// Data of CHRE_EVENT_AUDIO_SAMPLING_CHANGE.
struct chreAudioSourceStatusEvent {
  uint32_t handle;
  struct chreAudioSourceStatus status;
};

// Data of CHRE_EVENT_AUDIO_DATA.
struct chreAudioDataEvent {
  uint8_t version;
  uint8_t reserved[3];
  uint32_t handle;
  uint64_t timestamp;    // of the first sample, ns
  uint32_t sampleRate;   // Hz
  uint32_t sampleCount;  // samples
  uint8_t format;        // enum chreAudioDataFormat
  union {
    const uint8_t* samplesULaw8;
    const int16_t* samplesS16;
  };
};

// Fills `audioSource` for the source `handle` (handles count up from 0); false when there is none.
bool chreAudioGetSource(uint32_t handle, struct chreAudioSource* audioSource);
// Asks for, or gives back, a source's samples in buffers of `bufferDuration` every
// `deliveryInterval`.
bool chreAudioConfigureSource(uint32_t handle, bool enable, uint64_t bufferDuration,
                              uint64_t deliveryInterval);

#ifdef __cplusplus
}
#endif

#endif  // QZ_PLATFORM_CHRE_H_
