#include "app/SMSearchField.h"

#include "app/SMEditingCommand.h"

#include "app/menuMirroring.h"
#include "app/menuPicture.h"

#include <QAction>
#include <QCoreApplication>
#include <QInputMethodEvent>
#include <QKeyEvent>
#include <QPainter>
#include <QStyle>
#include <optional>
#include <string>

namespace {

constexpr int fontSize = 12;
constexpr int textMargin = 9;
constexpr QColor selection(0x3B, 0x6A, 0xF0);
constexpr QColor outline(0, 0, 0, 110);
constexpr QColor placeholderColor(0, 0, 0, 128);

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
    setFrame(false);
    setTextMargins(textMargin, 0, textMargin, 0);
    // Where the panel's own text begins, whichever way the keyboard writes.
    setAlignment(QStyle::visualAlignment(layoutDirection(), Qt::AlignLeft) | Qt::AlignAbsolute |
                 Qt::AlignVCenter);
    QFont textFont = font();
    textFont.setPixelSize(fontSize);
    setFont(textFont);
    QPalette colors = palette();
    colors.setColor(QPalette::Base, Qt::transparent);
    colors.setColor(QPalette::Text, Qt::black);
    colors.setColor(QPalette::Highlight, selection);
    colors.setColor(QPalette::HighlightedText, Qt::white);
    setPalette(colors);
    // The toolkit's own button fades in, which paints the panel ten times for one key.
    QAction* clearing =
        addAction(style()->standardIcon(QStyle::SP_LineEditClearButton), QLineEdit::TrailingPosition);
    clearing->setText(QCoreApplication::translate("SMSearchField", "Clear"));
    clearing->setVisible(false);
    connect(clearing, &QAction::triggered, this, &QLineEdit::clear);
    connect(this, &QLineEdit::textChanged, this, [this, clearing](const QString& text) {
        clearing->setVisible(!text.isEmpty());
        if (m_textHandler && !m_isSetFromCode) m_textHandler();
    });
}

void SMSearchField::setStringValue(const std::string& value) {
    m_isSetFromCode = true;
    setText(QString::fromStdString(value));
    m_isSetFromCode = false;
}

void SMSearchField::inputMethodEvent(QInputMethodEvent* event) {
    m_isComposing = !event->preeditString().isEmpty();
    update(); // the toolkit does so for the text alone
    QLineEdit::inputMethodEvent(event);
}

void SMSearchField::paintEvent(QPaintEvent* event) {
    const bool isEmpty = displayText().isEmpty() && !m_isComposing;
    if (isEmpty != m_isDrawnEmpty) {
        m_isDrawnEmpty = isEmpty;
        m_picture.invalidate();
    }
    {
        QPainter painter(this);
        m_picture.draw(painter, *this, [this](QPainter& onPicture) { drawField(onPicture); });
    }
    QLineEdit::paintEvent(event);
}

void SMSearchField::drawField(QPainter& painter) const {
    const QRectF inner = QRectF(rect()).adjusted(0.5, 0.5, -0.5, -0.5);
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(outline);
    painter.setBrush(Qt::white);
    painter.drawRoundedRect(inner, inner.height() / 2, inner.height() / 2);
    if (!m_isDrawnEmpty) return;
    constexpr int besideText = 2; // as the toolkit has it
    const QRect room = rect().adjusted(textMargin + besideText, 0, -textMargin - besideText, 0);
    painter.setFont(font());
    painter.setPen(placeholderColor);
    const auto leading = QStyle::visualAlignment(layoutDirection(), Qt::AlignLeft | Qt::AlignVCenter);
    painter.drawText(room, static_cast<int>(leading) | Qt::TextSingleLine, m_placeholder);
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
