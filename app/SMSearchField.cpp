#include "app/SMSearchField.h"
#include "app/SMEditingCommand.h"

#include "app/menuMirroring.h"

#include <QKeyEvent>
#include <optional>
#include <string>

namespace {

struct KeyCommand {
    int key;
    SMEditingCommand command;
};
constexpr KeyCommand keyCommands[] = {
    {Qt::Key_Escape, SMEditingCommand::cancelOperation}, {Qt::Key_Return, SMEditingCommand::insertNewline},
    {Qt::Key_Enter, SMEditingCommand::insertNewline},    {Qt::Key_Tab, SMEditingCommand::insertTab},
    {Qt::Key_Left, SMEditingCommand::moveLeft},          {Qt::Key_Right, SMEditingCommand::moveRight},
    {Qt::Key_Down, SMEditingCommand::moveDown},          {Qt::Key_Up, SMEditingCommand::moveUp},
};

std::optional<SMEditingCommand> commandOf(const QKeyEvent& event) {
    // Option is held to see the alternate rows; the walk goes on meanwhile.
    if (event.modifiers() & ~(Qt::KeypadModifier | Qt::AltModifier)) return {};
    int pressed = event.key();
    // The commands are meant for panes that stand from left to right.
    if (menuIsMirrored() && (pressed == Qt::Key_Left || pressed == Qt::Key_Right))
        pressed = pressed == Qt::Key_Left ? Qt::Key_Right : Qt::Key_Left;
    for (const auto& [key, command] : keyCommands)
        if (pressed == key) return command;
    return {};
}

} // namespace

SMSearchField::SMSearchField(QWidget* parent)
    : QLineEdit(parent) {
    connect(this, &QLineEdit::textChanged, this, [this] {
        if (m_textHandler && !m_isSetFromCode) m_textHandler();
    });
}

void SMSearchField::setStringValue(const std::string& value) {
    m_isSetFromCode = true;
    setText(QString::fromStdString(value));
    m_isSetFromCode = false;
}

bool SMSearchField::event(QEvent* event) {
    if (event->type() == QEvent::KeyPress && m_commandHandler) {
        const auto command = commandOf(*static_cast<QKeyEvent*>(event));
        if (command && m_commandHandler(*command)) {
            event->accept();
            return true;
        }
    }
    return QLineEdit::event(event);
}
