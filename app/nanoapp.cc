// SPDX-License-Identifier: Apache-2.0
#include "app/nanoapp.h"

#include "app/app_manager.h"
#include "chre/singleton.h"

using AppManagerSingleton = chre::Singleton<tarn::contexthub::sound::AppManager>;

bool nanoappStart() {
  AppManagerSingleton::init();
  return true;
}

void nanoappHandleEvent(uint32_t sender_instance_id, uint16_t event_type, const void* event_data) {
  AppManagerSingleton::get()->HandleEvent(sender_instance_id, event_type, event_data);
}

void nanoappEnd() {
  AppManagerSingleton::get()->Stop();
  AppManagerSingleton::deinit();
}
