#include "edit/model/edit_registry.h"

#include <atomic>

namespace {
std::atomic<EditRegistry*> installed{nullptr};
std::atomic<EditRegistry::Maker> makes{nullptr};
} // namespace

EditRegistry::~EditRegistry() {
    EditRegistry* self = this;
    installed.compare_exchange_strong(self, nullptr);
}

EditRegistry* EditRegistry::current() {
    return installed.load();
}

EditRegistry* EditRegistry::forOpening() {
    EditRegistry* const present = current();
    const Maker maker = makes.load();
    return present != nullptr || maker == nullptr ? present : maker();
}

void EditRegistry::setMaker(Maker maker) {
    makes = maker;
}

EditRegistry* EditRegistry::install(EditRegistry* registry) {
    return installed.exchange(registry);
}
