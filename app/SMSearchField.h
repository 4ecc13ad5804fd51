#pragma once

#include "app/SMEditingCommand.h"

#include <QLineEdit>
#include <functional>
#include <string>

/// The search field. Every command of a key goes to the delegate first; what that does not handle, the field
/// does.
class SMSearchField final : public QLineEdit {
public:
    using CommandHandler = std::function<bool(SMEditingCommand)>;

    explicit SMSearchField(QWidget* parent = nullptr);

    void setCommandHandler(CommandHandler handler) { m_commandHandler = std::move(handler); }
    /// Called when the user has changed the text, not after `setStringValue`.
    void setTextHandler(std::function<void()> handler) { m_textHandler = std::move(handler); }

    std::string stringValue() const { return text().toStdString(); }
    void setStringValue(const std::string& value);

protected:
    bool event(QEvent* event) override;

private:
    CommandHandler m_commandHandler;
    std::function<void()> m_textHandler;
    bool m_isSetFromCode = false;
};
