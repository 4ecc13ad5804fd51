#include "platform/linux/NotifierHost.h"

#include <QDBusMessage>
#include <QDBusPendingCallWatcher>
#include <QDBusPendingReply>
#include <functional>
#include <utility>

namespace platform {

QString NotifierHost::serviceName() {
    return QStringLiteral("org.kde.StatusNotifierWatcher");
}

QString NotifierHost::path() {
    return QStringLiteral("/StatusNotifierWatcher");
}

NotifierHost::NotifierHost(std::function<void(bool isPresent)> tell)
    : m_tell(std::move(tell)) {
    if (!m_bus.isConnected()) return;
    m_service.setConnection(m_bus);
    m_service.addWatchedService(serviceName());
    connect(
        &m_service, &QDBusServiceWatcher::serviceOwnerChanged, this,
        [this](const QString&, const QString&, const QString& newOwner) { serviceOwnerChanged(newOwner); });
    for (const char* change : {"StatusNotifierHostRegistered", "StatusNotifierHostUnregistered"})
        m_bus.connect(serviceName(), path(), serviceName(), QLatin1String(change), this, SLOT(ask()));
    m_bus.connect({}, QStringLiteral("/org/freedesktop/DBus/Local"),
                  QStringLiteral("org.freedesktop.DBus.Local"), QStringLiteral("Disconnected"), this,
                  SLOT(busWent()));
    ask();
}

void NotifierHost::ask() {
    auto call = QDBusMessage::createMethodCall(
        serviceName(), path(), QStringLiteral("org.freedesktop.DBus.Properties"), QStringLiteral("Get"));
    call << serviceName() << QStringLiteral("IsStatusNotifierHostRegistered");
    call.setAutoStartService(false);
    auto* watcher = new QDBusPendingCallWatcher(m_bus.asyncCall(call), this);
    m_lastCall = watcher;
    connect(watcher, &QDBusPendingCallWatcher::finished, this, &NotifierHost::answered);
}

void NotifierHost::answered(QDBusPendingCallWatcher* call) {
    call->deleteLater();
    if (call != m_lastCall) return;
    const QDBusPendingReply<QDBusVariant> reply = *call;
    m_tell(!reply.isError() && reply.value().variant().toBool());
}

void NotifierHost::serviceOwnerChanged(const QString& newOwner) {
    busWent();
    if (!newOwner.isEmpty()) ask();
}

void NotifierHost::busWent() {
    m_lastCall = nullptr;
    m_tell(false);
}

} // namespace platform
