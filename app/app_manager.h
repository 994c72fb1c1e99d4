// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "app/sound_service.h"
#include "chre.h"
#include "chre/fixed_size_vector.h"
#include "classifier/audio_classifier.h"
#include "classifier/types/confidence_event.h"
#include "classifier/types/sound_detection_event_listener_interface.h"
#include "proto/sound_detection_message_type.h"
#include "proto/sound_detection_proto_helper.h"

namespace tarn::contexthub::sound {

constexpr uint32_t kInvalidAudioHandle = 0xFFFFFFFF;
constexpr size_t kHostClientCapacity = 8;

// A host client and the endpoint that its detections go to.
struct ClientIdHostEndpointPair {
  uint16_t client_id;  // 0 to 255
  uint16_t host_endpoint;
};

// The whole nanoapp behind its entry points: dispatches the runtime's events, holds the microphone
// while some client needs it, and serves the host's clients. Failures are logged and the work is
// dropped. All on the nanoapp's event thread.
class AppManager : public SoundDetectionEventListenerInterface {
 public:
  AppManager();
  ~AppManager() override = default;
  AppManager(const AppManager&) = delete;
  AppManager& operator=(const AppManager&) = delete;

  void HandleEvent(uint32_t sender_instance_id, uint16_t event_type, const void* event_data);

  // Gives the audio back and forgets the smoothed scores; true when the audio is off afterwards.
  bool Stop();

  void OnSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                             uint64_t timestamp_ns) override;
  void OnRawAudioTransmissibleSegment(uint32_t model_version, uint64_t timestamp_ns,
                                      RawAudioInfo* info) override;

 private:
  // app_manager_audio.cc: the microphone.
  void DiscoverAudioSource();
  void RequestAudioData();
  void ReleaseAudioData();
  bool ShouldReleaseAudio();
  void HandleAudioEvent(const chreAudioDataEvent* event);

  // app_manager_host.cc: host clients.
  void HandleMessageFromHost(const chreMessageFromHostData* message);
  void HandleQueryRequest(uint16_t host_endpoint);
  void HandleEnableRequest(const chreMessageFromHostData* message);
  void HandleDisableRequest(const chreMessageFromHostData* message);
  bool AddClientIdHostEndpointPair(uint16_t client_id, uint16_t host_endpoint);
  // Index of the client's entry in the map, or its size.
  size_t FindHostClient(uint16_t client_id) const;
  void SendSoundDetectionEvent(const ConfidenceEvents& events, uint32_t model_version,
                               uint64_t timestamp_ns);
  // Sends a copy of the message to every host client; `send_failure` is logged for each refusal.
  void SendToHostClients(SoundDetectionMessageType type, ChreBuffer message, uint32_t size,
                         chreMessageFreeFunction* free_callback, const char* send_failure);

  bool is_audio_enabled_ = false;
  // Once a source was found this stays a handle.
  uint32_t audio_handle_ = kInvalidAudioHandle;
  // In order of enabling; no client ID and no endpoint twice.
  chre::FixedSizeVector<ClientIdHostEndpointPair, kHostClientCapacity> client_id_host_endpoint_map_;
  AudioClassifier audio_classifier_;
  SoundService sound_service_;
};

}  // namespace tarn::contexthub::sound
