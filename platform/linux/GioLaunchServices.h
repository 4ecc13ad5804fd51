#pragma once

#include "platform/LaunchServices.h"

namespace platform {

/// Desktop entries and their associations, through GIO. An asynchronous start over the bus needs GLib's
/// default main context to run.
class GioLaunchServices final : public LaunchServices {
public:
    void open(const LaunchRequest& request, LaunchHandler done) override;
    std::optional<std::string> openSettings(const std::string& pane) override;
    std::string typeOfScheme(const std::string& scheme) const override;
    std::string typeOfExtension(const std::string& extension) const override;
    std::string typeOfURL(const std::string& url) const override;
    std::optional<std::string> defaultApplication(const std::string& type) const override;
    std::vector<std::string> applications(const std::string& type) const override;
    Status setDefaultApplication(const std::string& type, const std::string& bundleIdentifier) override;
    std::optional<ApplicationRecord> applicationAtURL(const std::string& url) const override;
};

} // namespace platform
