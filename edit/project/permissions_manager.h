#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

/// Who owns each item of the current project and who may change it, kept in a file of the project's folder
/// ("Permissions.txt"). Records are read when first asked for and written at every change; without a project
/// folder they live in memory. All operations are safe on any thread.
class QM_API PermissionsManager {
public:
    /// Rights of a user.
    enum Right : int { NetworkRight = 2 };

    /// The name of the current user, UTF-8.
    [[nodiscard]] static String getCurrentUser();
    /// The user who last stored or took the item; empty if nobody is recorded.
    [[nodiscard]] static String getOwner(const cookie& item);
    /// Records the owner. With `onlyIfNone` an owner who is recorded already stays.
    static Qx::Status setOwner(const cookie& item, const String& user, bool onlyIfNone);
    /// True if the current user may not change the item.
    [[nodiscard]] static bool getReadOnly(const cookie& item);
    static Qx::Status setReadOnly(const cookie& item, bool readOnly);
    /// True if the current user has a right.
    [[nodiscard]] static bool hasRight(Right right);
    static void setRight(Right right, bool granted);
    /// Forgets what was read, so that the next question reads the current project's file.
    static void reload();
};
