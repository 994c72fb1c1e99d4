// SPDX-License-Identifier: Apache-2.0
#include "app/sound_service.h"

#include <cstring>

#include "chre.h"
#include "classifier/types/log_prefix.h"
#include "proto/sound_detection_proto_helper.h"

namespace tarn::contexthub::sound {
namespace {

constexpr const char* kLogPrefix = "SoundService:";

void ChreEventFree(uint16_t /*event_type*/, void* event_data) { chreHeapFree(event_data); }

}  // namespace

void SoundService::RegisterClient(uint32_t instance_id) {
  chreLog(CHRE_LOG_INFO, "%s %s registerClient %u", kApplicationLogPrefix, kLogPrefix, instance_id);
  if (clients_.find(instance_id) != clients_.size()) {
    chreLog(CHRE_LOG_ERROR, "%s %s already registered", kApplicationLogPrefix, kLogPrefix);
    return;
  }
  if (!clients_.push_back(instance_id)) {
    chreLog(CHRE_LOG_ERROR, "%s %s failed to register", kApplicationLogPrefix, kLogPrefix);
  }
}

void SoundService::UnregisterClient(uint32_t instance_id) {
  chreLog(CHRE_LOG_INFO, "%s %s unregisterClient %u", kApplicationLogPrefix, kLogPrefix,
          instance_id);
  const size_t index = clients_.find(instance_id);
  if (index == clients_.size()) {
    chreLog(CHRE_LOG_ERROR, "%s %s not registered", kApplicationLogPrefix, kLogPrefix);
    return;
  }
  clients_.erase(index);
}

void SoundService::PublishEvent(const ConfidenceEvents* events, uint32_t model_version,
                                uint64_t timestamp_ns) {
  uint32_t size = 0;
  const ChreBuffer report =
      EncodeDetectionResponseMessage(GetDetectionEventResponse(events, model_version, timestamp_ns),
                                     /*with_length_prefix=*/true, &size);
  if (!report) {
    chreLog(CHRE_LOG_ERROR, "%s Unable to encode response message", kApplicationLogPrefix);
    return;
  }
  for (const uint32_t client : clients_) {
    ChreBuffer copy = ChreBuffer::Allocate(size);
    if (!copy) {
      chreLog(CHRE_LOG_ERROR,
              "%s Failed to allocate output buffer of size %zuh for publishing eventto client #%u",
              kApplicationLogPrefix, static_cast<size_t>(size), client);
      return;
    }
    memcpy(copy.get(), report.get(), size);
    chreSendEvent(kSoundServiceDetectionEvent, copy.release(), ChreEventFree, client);
  }
}

}  // namespace tarn::contexthub::sound
