#include "lib/kxAppKit/system/KXWorkspace.h"
#include "lib/plist/Value.h"
#include "platform/LaunchServices.h"
#include "platform/Status.h"

#include <optional>
#include <string>
#include <utility>

namespace {

KXWorkspace::Identifier DefaultFor(const platform::LaunchServices& launching, const std::string& type) {
    return type.empty() ? std::nullopt : launching.defaultApplication(type);
}

KXWorkspace::Identifiers AllFor(const platform::LaunchServices& launching, const std::string& type) {
    if (type.empty()) return {};
    auto all = launching.applications(type);
    return all.empty() ? std::nullopt : std::optional(std::move(all));
}

} // namespace

KXWorkspace::Identifier
KXWorkspace::bundleIdentifierOfDefaultApplicationForURLScheme(const Launching& launching,
                                                              const std::string& scheme) {
    return DefaultFor(launching, launching.typeOfScheme(scheme));
}

KXWorkspace::Identifiers KXWorkspace::bundleIdentifiersOfApplicationsForURLScheme(const Launching& launching,
                                                                                  const std::string& scheme) {
    return AllFor(launching, launching.typeOfScheme(scheme));
}

KXWorkspace::Identifier
KXWorkspace::bundleIdentifierOfDefaultApplicationForFileExtension(const Launching& launching,
                                                                  const std::string& extension) {
    return DefaultFor(launching, launching.typeOfExtension(extension));
}

KXWorkspace::Identifier
KXWorkspace::bundleIdentifierOfAssignedApplicationForFileOrURL(const Launching& launching,
                                                               const std::string& url) {
    return DefaultFor(launching, launching.typeOfURL(url));
}

KXWorkspace::Identifiers KXWorkspace::bundleIdentifiersOfApplicationsForFileOrURL(const Launching& launching,
                                                                                  const std::string& url) {
    return AllFor(launching, launching.typeOfURL(url));
}

KXWorkspace::Identifier KXWorkspace::bundleIdentifierOfApplicationAtURL(const Launching& launching,
                                                                        const std::string& url) {
    return bundleInfoDictionaryOfApplicationAtURL(launching, url)["CFBundleIdentifier"].string();
}

plist::Value KXWorkspace::bundleInfoDictionaryOfApplicationAtURL(const Launching& launching,
                                                                 const std::string& url) {
    const auto record = launching.applicationAtURL(url);
    if (!record) return {};
    plist::Dictionary info{{"LSUIElement", record->isUIElement}};
    if (record->bundleIdentifier) info.set("CFBundleIdentifier", *record->bundleIdentifier);
    for (const auto& [key, text] : {std::pair("CFBundleName", &record->name),
                                    {"CFBundleExecutable", &record->executable},
                                    {"CFBundleIconFile", &record->icon}})
        if (!text->empty()) info.set(key, *text);
    if (record->urlSchemes.empty()) return info;
    const plist::Array schemes(record->urlSchemes.begin(), record->urlSchemes.end());
    info.set("CFBundleURLTypes", plist::Array{plist::Dictionary{{"CFBundleURLSchemes", schemes}}});
    return info;
}

int KXWorkspace::setDefaultHandlerForURLScheme(Launching& launching, const std::string& scheme,
                                               const std::string& bundleIdentifier) {
    const auto type = launching.typeOfScheme(scheme);
    return type.empty() ? platform::status::invalidParameter
                        : launching.setDefaultApplication(type, bundleIdentifier);
}
