#pragma once

#include <QDBusConnection>
#include <QDBusServiceWatcher>
#include <QObject>
#include <functional>

class QDBusPendingCallWatcher;

namespace platform {

/// Watches the session bus for hosts of status notifier items. Everything happens without waiting for the
/// bus.
class NotifierHost final : public QObject {
    Q_OBJECT

public:
    /// Called with every answer there is: also repeatedly with the same one, and with `false` in between when
    /// the host restarts.
    explicit NotifierHost(std::function<void(bool isPresent)> tell);

    static QString serviceName();
    static QString path();

private Q_SLOTS:
    void ask();
    void busWent();

private:
    void serviceOwnerChanged(const QString& newOwner);
    void answered(QDBusPendingCallWatcher* call);

    std::function<void(bool isPresent)> m_tell;
    QDBusConnection m_bus = QDBusConnection::sessionBus();
    QDBusServiceWatcher m_service;
    const QObject* m_lastCall = nullptr; ///< the answers to those before are out of date
};

} // namespace platform
