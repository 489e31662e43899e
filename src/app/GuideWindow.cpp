// SPDX-License-Identifier: Apache-2.0
#include "GuideWindow.h"

#include <QTextBrowser>
#include <QUrl>
#include <QVBoxLayout>

// Outside of namespaces, as the macro wants it.
static void initGuide()
{
    Q_INIT_RESOURCE(guide);
}

GuideWindow::GuideWindow(QWidget *parent)
    : QDialog(parent)
{
    initGuide();
    setObjectName("GuideWindow");
    setWindowTitle("Corvane Guide");
    resize(720, 560);
    auto *browser = new QTextBrowser;
    browser->setObjectName("tb_guide");
    browser->setAccessibleName("Guide");
    browser->document()->setDocumentMargin(16);
    browser->setSource(QUrl("qrc:/guide/index.md"), QTextDocument::MarkdownResource);
    auto *layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->addWidget(browser);
}
