#pragma once

#include <functional>
#include <gio/gio.h>
#include <string>
#include <vector>

namespace platform {

/// Starts an application, or brings it to the front, through its well-known name on the bus, and has it open
/// the documents. Answers why not, empty for success: when the application has taken it in.
std::string StartOverBusAndWait(GDBusConnection* bus, const std::string& name,
                                const std::vector<std::string>& documentURLs);

/// The same without waiting: the answer comes from GLib's default main context.
void StartOverBus(GDBusConnection* bus, const std::string& name, const std::vector<std::string>& documentURLs,
                  std::function<void(const std::string& failure)> done);

} // namespace platform
