#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"

#include <functional>
#include <memory>

/// Messages between the seats of a project. One machine alone is the default: network mode is off and
/// messages go nowhere.
namespace Qx::Network {

/// Message kinds. The numbers travel between machines: do not change them.
enum MessageKind : int {
    EditWritten = 2,     ///< an edit's file was stored
    EditDeleted = 3,     ///< an edit's file was deleted, with its backups
    EditBeingChanged = 5 ///< a user began to change an item
};

struct Message {
    int kind = 0;
    cookie item;
    String user;
};

using Listener = std::function<void(const Message&)>;

/// The service that carries messages. Thread-safe.
class QM_API Service {
public:
    virtual ~Service();
    /// Hands the message to every other seat.
    virtual void send(const Message& message) = 0;
    /// Hears what others send until the returned object is destroyed.
    [[nodiscard]] virtual std::shared_ptr<void> listen(Listener listener) = 0;
};

/// True when messages are carried; set by the application.
QM_API bool networkMode();
QM_API void setNetworkMode(bool on);

/// Sends through the installed service when network mode is on; otherwise does nothing.
QM_API void send(const Message& message);

/// Installs the service; null removes it. Returns the one before. The caller shares ownership.
QM_API std::shared_ptr<Service> setService(std::shared_ptr<Service> service);
/// The service in place; null if none.
[[nodiscard]] QM_API std::shared_ptr<Service> service();

} // namespace Qx::Network
