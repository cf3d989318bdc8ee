#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"

/// Who owns each item of the current project and who may change it, kept in a file of the project's folder
/// ("Permissions.txt"). Records are read when first asked for, and again when another project became the
/// current one; a change is made to what the file holds at that moment, under the lock of the project's
/// folder, and is durable when the call returns, so that seats that share a project do not undo each other's
/// records. Without a project folder, and for items that are never stored (kind 'F', words beyond the
/// cookie's text), records live in memory until another project becomes the current one.
///
/// A damaged file is logged, counts as empty and is never written over: changes fail until it is mended or
/// removed. A change that fails has changed nothing; one that changes nothing touches no file. All operations
/// are safe on any thread.
class QM_API PermissionsManager {
public:
    /// Rights of a user.
    enum Right : int { NetworkRight = 2 };

    /// The name of the current user, UTF-8.
    [[nodiscard]] static String getCurrentUser();
    /// The user who last stored or took the item; empty if nobody is recorded.
    [[nodiscard]] static String getOwner(const cookie& item);
    /// Records the owner; an empty name forgets it. With `onlyIfNone` an owner who is recorded already stays.
    /// Fails for the invalid cookie and for a name that is not UTF-8.
    static Qx::Status setOwner(const cookie& item, const String& user, bool onlyIfNone);
    /// Takes notice of the owner that an item's own file names, for the session: in memory only, no file is
    /// written. It is what `getOwner` answers until another owner is recorded or another project becomes the
    /// current one. With `onlyIfNone` an owner who is known already stays. An empty name, one that is not
    /// UTF-8 and the invalid cookie are ignored.
    static void noteOwner(const cookie& item, const String& owner, bool onlyIfNone);
    /// True if the current user may not change the item. A mark holds for every user, the owner among them.
    [[nodiscard]] static bool getReadOnly(const cookie& item);
    static Qx::Status setReadOnly(const cookie& item, bool readOnly);
    /// True if the current user has a right. Rights are the application's to grant for the session; at first
    /// there are none. They are kept in memory.
    [[nodiscard]] static bool hasRight(Right right);
    static void setRight(Right right, bool granted);
    /// Forgets what was read, so that the next question reads the current project's file.
    static void reload();
};
