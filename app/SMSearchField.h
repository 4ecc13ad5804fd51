#pragma once

#include "app/SMEditingCommand.h"
#include "app/menuPicture.h"

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

    /// Kept here: the toolkit would lay it out anew at every painting.
    void setPlaceholderText(const QString& text) { m_placeholder = text; }

    std::string stringValue() const { return text().toStdString(); }
    void setStringValue(const std::string& value);

protected:
    bool event(QEvent* event) override;
    void inputMethodEvent(QInputMethodEvent* event) override;
    void paintEvent(QPaintEvent* event) override;

private:
    void drawField(QPainter& painter) const;

    MenuPicture m_picture;
    bool m_isDrawnEmpty = true;
    bool m_isComposing = false; ///< an input method's letters stand there, which are not text yet
    QString m_placeholder;
    CommandHandler m_commandHandler;
    std::function<void()> m_textHandler;
    bool m_isSetFromCode = false;
};
