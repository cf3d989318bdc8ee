#include "edit/model/edit_registry.h"

#include <atomic>

namespace {
std::atomic<EditRegistry*> installed{nullptr};
}

EditRegistry::~EditRegistry() {
    EditRegistry* self = this;
    installed.compare_exchange_strong(self, nullptr);
}

EditRegistry* EditRegistry::current() {
    return installed.load();
}

EditRegistry* EditRegistry::install(EditRegistry* registry) {
    return installed.exchange(registry);
}
