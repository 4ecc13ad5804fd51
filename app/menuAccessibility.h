#pragma once

class QWidget;
class SMMenuButton;

/// Shows assistive technology the rows and buttons that are no widgets. Every list holds one object for each
/// position, which stands for whatever row is there when it is asked.

/// Before the first menu window; again does nothing.
void InstallMenuAccessibility();

/// The keyboard has moved the highlight to the button that `host`, a list or a button widget, shows.
void ReportMenuFocus(QWidget& host, const SMMenuButton& button);
