// SPDX-License-Identifier: Apache-2.0
#include "app/app_manager.h"

#include "classifier/types/log_prefix.h"

namespace tarn::contexthub::sound {

AppManager::AppManager() { audio_classifier_.RegisterListener(this); }

void AppManager::HandleEvent(uint32_t sender_instance_id, uint16_t event_type,
                             const void* event_data) {
  switch (event_type) {
    case CHRE_EVENT_MESSAGE_FROM_HOST:
      HandleMessageFromHost(static_cast<const chreMessageFromHostData*>(event_data));
      break;
    case CHRE_EVENT_NANOAPP_STARTED:
      break;
    case CHRE_EVENT_NANOAPP_STOPPED:
      sound_service_.UnregisterClient(static_cast<const chreNanoappInfo*>(event_data)->instanceId);
      break;
    case CHRE_EVENT_AUDIO_SAMPLING_CHANGE: {
      const auto* event = static_cast<const chreAudioSourceStatusEvent*>(event_data);
      chreLog(CHRE_LOG_INFO, "%s audio sampling change for handle %u, suspended: %d",
              kApplicationLogPrefix, event->handle, event->status.suspended);
      break;
    }
    case CHRE_EVENT_AUDIO_DATA:
      HandleAudioEvent(static_cast<const chreAudioDataEvent*>(event_data));
      break;
    case kSoundServiceRegisterEvent:
      sound_service_.RegisterClient(sender_instance_id);
      if (!is_audio_enabled_) {
        chreLog(CHRE_LOG_INFO, "%s Start", kApplicationLogPrefix);
        RequestAudioData();
      }
      break;
    case kSoundServiceUnregisterEvent:
      sound_service_.UnregisterClient(sender_instance_id);
      if (ShouldReleaseAudio()) Stop();
      break;
    default:
      chreLog(CHRE_LOG_WARN, "%s unknown event: %d", kApplicationLogPrefix, event_type);
  }
}

bool AppManager::Stop() {
  chreLog(CHRE_LOG_INFO, "%s Stop", kApplicationLogPrefix);
  ReleaseAudioData();
  audio_classifier_.ClearConfidenceBuffer();
  return !is_audio_enabled_;
}

void AppManager::OnSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                                       uint64_t timestamp_ns) {
  SendSoundDetectionEvent(events, model_version, timestamp_ns);
}

}  // namespace tarn::contexthub::sound
