// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>

class QTextBrowser;

/// The guide: the user guide and pages for tasks, which lie in the program, so that no network is
/// needed.
class GuideWindow : public QDialog
{
    Q_OBJECT

public:
    explicit GuideWindow(QWidget *parent = nullptr);

    /// Shows the part of the user guide under a heading, named as links name it ("create-signal"),
    /// or the contents for an empty name.
    void showPage(const QString &heading);

    /// The headings of the user guide, as links name them.
    [[nodiscard]] static QStringList headings();

private:
    void scrollToHeading(const QUrl &source);

    QTextBrowser *m_browser = nullptr;
};

/// Says where in the user guide a window is explained, for F1.
void setGuidePage(QWidget &window, const QString &heading);

/// What setGuidePage() said of the window or of one that it belongs to; empty if nothing.
[[nodiscard]] QString guidePageOf(const QWidget *window);
