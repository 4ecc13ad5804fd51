#pragma once

#include "lib/kxAppKit/system/KXWorkspace.h"

#include <map>
#include <string>
#include <vector>

/// A desktop made of what a test says: windows, session, settings. Starts nothing, and nothing opens
/// anything.
struct InMemoryDesktop {
    struct Windows final : platform::Workspace {
        int front = 0;
        unsigned desktop = 0;
        platform::Status error = platform::status::success;

        int frontProcessID() const override { return front; }
        platform::Status bringToFront(int, platform::ProcessWindows) const override { return error; }
        platform::Status currentDesktop(unsigned& number) const override {
            number = desktop;
            return error;
        }
    } windows;

    struct Session final : platform::Session {
        std::optional<bool> active;
        std::optional<bool> isActive() const override { return active; }
    } session;

    struct Defaults final : platform::UserDefaults {
        std::map<std::string, int> values;
        int integerForKey(std::string_view key) const override {
            const auto found = values.find(std::string(key));
            return found == values.end() ? 0 : found->second;
        }
    } dock;

    struct Launching final : platform::LaunchServices {
        std::vector<platform::LaunchRequest> requests;
        platform::LaunchOutcome outcome;
        std::optional<std::string> settingsFailure;

        void open(const platform::LaunchRequest& request, LaunchHandler done) override {
            requests.push_back(request);
            done(outcome);
        }
        std::optional<std::string> openSettings(const std::string&) override { return settingsFailure; }
        std::string typeOfScheme(const std::string&) const override { return {}; }
        std::string typeOfExtension(const std::string&) const override { return {}; }
        std::string typeOfURL(const std::string&) const override { return {}; }
        std::optional<std::string> defaultApplication(const std::string&) const override { return {}; }
        std::vector<std::string> applications(const std::string&) const override { return {}; }
        platform::Status setDefaultApplication(const std::string&, const std::string&) override {
            return platform::status::unsupported;
        }
        std::optional<platform::ApplicationRecord> applicationAtURL(const std::string&) const override {
            return {};
        }
    } launching;

    KXWorkspace::Services services(platform::ProcessTable& processes) {
        return {processes, windows, session, dock, launching};
    }
};
