#pragma once

#include "app/menuPicture.h"

#include <QComboBox>

/// A pop-up list that shows its choice as a white title with an arrow, and nothing around it.
class SMTitlePopUpButton final : public QComboBox {
public:
    explicit SMTitlePopUpButton(QWidget* parent = nullptr);

protected:
    void paintEvent(QPaintEvent* event) override;
    /// The wheel scrolls the menu, wherever the pointer is.
    void wheelEvent(QWheelEvent* event) override;

private:
    void drawTitle(QPainter& painter) const;

    MenuPicture m_picture;
    QString m_drawnTitle;
};
