#include "app/SMMenuButtonWidget.h"

#include "app/SMMenuButton.h"
#include "app/SMMenuHostWidget.h"

#include <QPainter>

SMMenuButtonWidget::SMMenuButtonWidget(QWidget* parent)
    : SMMenuHostWidget(parent) {
    setAttribute(Qt::WA_TransparentForMouseEvents);
}

void SMMenuButtonWidget::setButton(SMMenuButton* button) {
    if (m_button) m_button->setSuperview(nullptr);
    m_button = button;
    if (m_button) m_button->setSuperview(this);
    update();
}

void SMMenuButtonWidget::paintEvent(QPaintEvent*) {
    if (!m_button) return;
    QPainter painter(this);
    m_button->draw(painter, {static_cast<float>(width()), static_cast<float>(height())}, tools());
}
