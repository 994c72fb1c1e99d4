// SPDX-License-Identifier: Apache-2.0
// The AppManager's microphone: found, requested while a client needs it, released with the last
// one.

#include "app/app_manager.h"
#include "classifier/types/log_prefix.h"

namespace tarn::contexthub::sound {
namespace {

constexpr uint32_t kAudioSampleRateHz = 16000;
constexpr uint64_t kAudioBufferDurationNs = 2'000'000'000;
constexpr uint32_t kAudioEventSampleCount = 32000;

// Entries of the periodic report.
constexpr uint32_t kReportSize = 2;

bool IsSuitable(const chreAudioSource& source) {
  return source.sampleRate == kAudioSampleRateHz &&
         source.minBufferDuration <= kAudioBufferDurationNs &&
         source.maxBufferDuration >= kAudioBufferDurationNs;
}

}  // namespace

void AppManager::DiscoverAudioSource() {
  chreAudioSource source;
  for (uint32_t handle = 0; chreAudioGetSource(handle, &source); ++handle) {
    if (IsSuitable(source)) {
      audio_handle_ = handle;
      chreLog(CHRE_LOG_INFO, "%s Found suitable audio source", kApplicationLogPrefix);
      break;
    }
  }
  if (audio_handle_ == kInvalidAudioHandle) {
    chreLog(CHRE_LOG_WARN, "%s Found no suitable audio source", kApplicationLogPrefix);
  }
}

void AppManager::RequestAudioData() {
  if (is_audio_enabled_) {
    chreLog(CHRE_LOG_INFO, "%s Audio already enabled", kApplicationLogPrefix);
    return;
  }
  DiscoverAudioSource();
  if (audio_handle_ == kInvalidAudioHandle) return;
  chreLog(CHRE_LOG_INFO, "%s Enabling audio", kApplicationLogPrefix);
  is_audio_enabled_ =
      chreAudioConfigureSource(audio_handle_, true, kAudioBufferDurationNs, kAudioBufferDurationNs);
  chreLog(CHRE_LOG_INFO, "%s Requested audio from handle %u, status: %d", kApplicationLogPrefix,
          audio_handle_, is_audio_enabled_);
}

void AppManager::ReleaseAudioData() {
  if (!is_audio_enabled_ || audio_handle_ == kInvalidAudioHandle) return;
  chreLog(CHRE_LOG_INFO, "%s Disabling audio", kApplicationLogPrefix);
  chreAudioConfigureSource(audio_handle_, false, 0, 0);
  is_audio_enabled_ = false;
}

bool AppManager::ShouldReleaseAudio() {
  const size_t host_count = client_id_host_endpoint_map_.size();
  const bool has_internal_client = sound_service_.HasClients();
  chreLog(CHRE_LOG_INFO, "%s is_audio_enabled_ = %d; HostCount = %zu; hasInternalClient = %d",
          kApplicationLogPrefix, is_audio_enabled_, host_count, has_internal_client);
  return is_audio_enabled_ && host_count == 0 && !has_internal_client;
}

void AppManager::HandleAudioEvent(const chreAudioDataEvent* event) {
  if (event->sampleCount != kAudioEventSampleCount) {
    chreLog(CHRE_LOG_WARN, "%s Audio data is not fully populated in chreAudioDataEvent.",
            kApplicationLogPrefix);
    return;
  }
  ConfidenceEvents report;
  for (uint32_t i = 0; i < kReportSize; ++i) report.push_back({0, 0.0f});
  uint32_t model_version = 0;
  audio_classifier_.Classify(event->samplesS16, report.data(), kReportSize, &model_version);
  const uint64_t timestamp_ns =
      chreGetTime() + static_cast<uint64_t>(chreGetEstimatedHostTimeOffset());
  sound_service_.PublishEvent(&report, model_version, timestamp_ns);
}

}  // namespace tarn::contexthub::sound
