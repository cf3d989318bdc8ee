#pragma once

#include "platform/base/export.h"

/// Hears when a header store becomes dirty.
class QM_API Dirtiable {
public:
    virtual ~Dirtiable();
    virtual void onConfigbDirty() = 0;
};
