// No mixer (a machine without sound), the fake mixer of the tests, and the dispatch of
// platform/mixer.h to the installed backend.
#include "platform/mixer.h"

static int noneOpen(std::string*) { return 0; }
static void noneClose() {}
static int noneSources(std::vector<MixerSource>*, int*) { return 0; }
static int noneSelect(int) { return 0; }
static int noneLevel(int*, int*, int*) { return 0; }
static int noneSetLevel(int) { return 0; }
static int noneGetSwitch(bool*) { return 0; }
static int noneSwitchOn() { return 0; }
static void noneWatch(void (*)()) {}
static const MixerBackend noneBackend = {noneOpen,     noneClose,     noneSources,  noneSelect, noneLevel,
                                         noneSetLevel, noneGetSwitch, noneSwitchOn, noneWatch};

static const MixerBackend* installedBackend = &noneBackend;

void setMixerBackend(const MixerBackend* backend) { installedBackend = backend ? backend : &noneBackend; }

int mixerOpen(std::string* name) { return installedBackend->open(name); }
void mixerClose() { installedBackend->close(); }
int mixerSources(std::vector<MixerSource>* sources, int* selected) { return installedBackend->sources(sources, selected); }
int mixerSelectSource(int index) { return installedBackend->selectSource(index); }
int mixerLevel(int* minimum, int* maximum, int* value) { return installedBackend->level(minimum, maximum, value); }
int mixerSetLevel(int value) { return installedBackend->setLevel(value); }
int mixerSwitch(bool* on) { return installedBackend->getSwitch(on); }
int mixerSwitchOn() { return installedBackend->switchOn(); }
void mixerWatch(void (*changed)()) { installedBackend->watch(changed); }

// ---- the fake mixer ----

FakeMixer fakeMixer;

static bool fakeReady() { return fakeMixer.isOpen && !fakeMixer.failing; }
static bool fakeSelected() {
    return fakeReady() && fakeMixer.selected >= 0 && fakeMixer.selected < int(fakeMixer.sources.size());
}

static int fakeOpen(std::string* name) {
    if (fakeMixer.failing) return 0;
    fakeMixer.isOpen = true;
    fakeMixer.opens++;
    *name = fakeMixer.name;
    return 1;
}
static void fakeClose() { fakeMixer.isOpen = false; }
static int fakeSources(std::vector<MixerSource>* sources, int* selected) {
    if (!fakeReady()) return 0;
    *sources = fakeMixer.sources;
    *selected = fakeMixer.selected;
    return 1;
}
static int fakeSelect(int index) {
    if (!fakeReady() || index < 0 || index >= int(fakeMixer.sources.size())) return 0;
    fakeMixer.selected = index;
    return 1;
}
static int fakeLevel(int* minimum, int* maximum, int* value) {
    if (!fakeSelected()) return 0;
    *minimum = fakeMixer.minimum;
    *maximum = fakeMixer.maximum;
    *value = fakeMixer.levels[size_t(fakeMixer.selected)];
    return 1;
}
static int fakeSetLevel(int value) {
    if (!fakeSelected()) return 0;
    fakeMixer.levels[size_t(fakeMixer.selected)] = value;
    return 1;
}
static int fakeGetSwitch(bool* on) {
    if (!fakeSelected()) return 0;
    *on = fakeMixer.on[size_t(fakeMixer.selected)];
    return 1;
}
static int fakeSwitchOn() {
    if (!fakeSelected()) return 0;
    fakeMixer.on[size_t(fakeMixer.selected)] = true;
    return 1;
}
static const MixerBackend fakeBackend = {fakeOpen,     fakeClose,     fakeSources,  fakeSelect, fakeLevel,
                                         fakeSetLevel, fakeGetSwitch, fakeSwitchOn, noneWatch};

void installFakeMixer() { setMixerBackend(&fakeBackend); }
