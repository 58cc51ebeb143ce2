// The mixer over PulseAudio: the server's sources are the source selector, the server's
// default source is the one that records (it is what the capture records from), its volume is
// the level (0 to 100 %, PA_VOLUME_NORM) and its mute the on/off switch.
#include <algorithm>
#include <cctype>
#include <cstring>

#include "platform/mainloop.h"
#include "platform/mixer.h"
#include "platform/pulse/pulseBackends.h"
#include "platform/pulse/pulseServer.h"

struct SourceInfo {
    std::string id;          // the server's name of the source
    std::string description;
    bool microphone;
    pa_cvolume volume;
    bool muted;
};

struct PulseMixer {
    std::vector<SourceInfo> sources;   // as last listed; indexes are the page's
    std::string defaultSource;         // the server's default source
    void (*changed)() = nullptr;       // the watcher
};
static PulseMixer mixer;   // under the loop's lock

static bool contains(std::string text, const char* part) {
    std::transform(text.begin(), text.end(), text.begin(), [](unsigned char c) { return char(std::tolower(c)); });
    return text.find(part) != std::string::npos;
}

static void serverInfoArrived(pa_context*, const pa_server_info* info, void* name) {
    if (info) {
        if (name) *static_cast<std::string*>(name) = std::string("PulseAudio ") + (info->server_version ? info->server_version : "");
        mixer.defaultSource = info->default_source_name ? info->default_source_name : "";
    }
    pulseSignal();
}

static void sourceArrived(pa_context*, const pa_source_info* info, int last, void*) {
    if (last || !info) {
        pulseSignal();
        return;
    }
    SourceInfo source;
    source.id = info->name ? info->name : "";
    source.description = info->description ? info->description : source.id;
    const char* formFactor = pa_proplist_gets(info->proplist, PA_PROP_DEVICE_FORM_FACTOR);
    bool monitor = info->monitor_of_sink != PA_INVALID_INDEX;
    source.microphone = !monitor && ((formFactor && std::strcmp(formFactor, "microphone") == 0) ||
                                     (info->active_port && contains(info->active_port->name, "mic")) ||
                                     contains(source.description, "mic"));
    source.volume = info->volume;
    source.muted = info->mute != 0;
    mixer.sources.push_back(source);
}

// With the lock held: the sources and the default source read afresh. false when the server fails.
static bool readSources(pa_context* context) {
    mixer.sources.clear();
    if (!pulseWaitFor(pa_context_get_server_info(context, serverInfoArrived, nullptr))) return false;
    return pulseWaitFor(pa_context_get_source_info_list(context, sourceArrived, nullptr)) != 0;
}

static const SourceInfo* recordingSource() {
    for (const SourceInfo& source : mixer.sources)
        if (source.id == mixer.defaultSource) return &source;
    return nullptr;
}

static int pulseMixerOpen(std::string* name) {
    PulseLock lock;
    pa_context* context = pulseContext();
    if (!context) return 0;
    return pulseWaitFor(pa_context_get_server_info(context, serverInfoArrived, name));
}

static void pulseMixerClose() {}

static int pulseMixerSources(std::vector<MixerSource>* sources, int* selected) {
    PulseLock lock;
    pa_context* context = pulseContext();
    if (!context || !readSources(context)) return 0;
    sources->clear();
    *selected = -1;
    for (size_t i = 0; i < mixer.sources.size(); i++) {
        sources->push_back({mixer.sources[i].description, mixer.sources[i].microphone});
        if (mixer.sources[i].id == mixer.defaultSource) *selected = int(i);
    }
    return 1;
}

static int pulseMixerSelect(int index) {
    PulseLock lock;
    pa_context* context = pulseContext();
    if (!context || index < 0 || index >= int(mixer.sources.size())) return 0;
    const std::string id = mixer.sources[size_t(index)].id;
    if (!pulseWaitFor(pa_context_set_default_source(context, id.c_str(), nullptr, nullptr))) return 0;
    mixer.defaultSource = id;
    return 1;
}

static int pulseMixerLevel(int* minimum, int* maximum, int* value) {
    PulseLock lock;
    pa_context* context = pulseContext();
    if (!context || !readSources(context)) return 0;
    const SourceInfo* source = recordingSource();
    if (!source) return 0;
    *minimum = int(PA_VOLUME_MUTED);
    *maximum = int(PA_VOLUME_NORM);
    *value = int(pa_cvolume_avg(&source->volume));
    return 1;
}

static int pulseMixerSetLevel(int value) {
    PulseLock lock;
    pa_context* context = pulseContext();
    const SourceInfo* source = context ? recordingSource() : nullptr;
    if (!source) return 0;
    pa_cvolume volume = source->volume;
    pa_cvolume_set(&volume, volume.channels, pa_volume_t(std::clamp(value, 0, int(PA_VOLUME_NORM))));
    return pulseWaitFor(pa_context_set_source_volume_by_name(context, source->id.c_str(), &volume, nullptr, nullptr));
}

static int pulseMixerGetSwitch(bool* on) {
    PulseLock lock;
    pa_context* context = pulseContext();
    if (!context || !readSources(context)) return 0;
    const SourceInfo* source = recordingSource();
    if (!source) return 0;
    *on = !source->muted;
    return 1;
}

static int pulseMixerSwitchOn() {
    PulseLock lock;
    pa_context* context = pulseContext();
    const SourceInfo* source = context ? recordingSource() : nullptr;
    if (!source) return 0;
    return pulseWaitFor(pa_context_set_source_mute_by_name(context, source->id.c_str(), 0, nullptr, nullptr));
}

static void serverChanged(pa_context*, pa_subscription_event_type_t, uint32_t, void*) {
    if (void (*changed)() = mixer.changed) postToMainLoop(changed);
}

static void pulseMixerWatch(void (*changed)()) {
    PulseLock lock;
    mixer.changed = changed;
    pa_context* context = pulseContext();
    if (!context) return;
    pa_context_set_subscribe_callback(context, changed ? serverChanged : nullptr, nullptr);
    pa_subscription_mask_t mask =
        changed ? pa_subscription_mask_t(PA_SUBSCRIPTION_MASK_SOURCE | PA_SUBSCRIPTION_MASK_SERVER) : PA_SUBSCRIPTION_MASK_NULL;
    pulseWaitFor(pa_context_subscribe(context, mask, nullptr, nullptr));
}

static const MixerBackend pulseMixerBackend = {pulseMixerOpen,     pulseMixerClose,     pulseMixerSources,
                                               pulseMixerSelect,   pulseMixerLevel,     pulseMixerSetLevel,
                                               pulseMixerGetSwitch, pulseMixerSwitchOn, pulseMixerWatch};

void installPulseMixer() { setMixerBackend(&pulseMixerBackend); }
