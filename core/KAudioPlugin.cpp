#include "core/KAudioPlugin.h"

KAudioPlugin::~KAudioPlugin() = default;
