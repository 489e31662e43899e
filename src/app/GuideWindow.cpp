// SPDX-License-Identifier: Apache-2.0
#include "GuideWindow.h"

#include "appearance/lineicon.h"

#include <QAbstractTextDocumentLayout>
#include <QFile>
#include <QHBoxLayout>
#include <QImage>
#include <QRegularExpression>
#include <QScrollBar>
#include <QTextBlock>
#include <QTextBrowser>
#include <QToolButton>
#include <QUrl>
#include <QVBoxLayout>

#include <algorithm>

// Outside of namespaces, as the macro wants it.
static void initGuide()
{
    Q_INIT_RESOURCE(guide);
}

namespace {

constexpr char PageProperty[] = "guidePage";
constexpr int Margin = 16;

/// "Export: waveforms" becomes "export-waveforms", as the platforms that show such files do it.
QString linkName(const QString &heading)
{
    static const QRegularExpression dropped("[^\\w\\- ]");
    return heading.toLower().remove(dropped).replace(' ', '-');
}

/// Shows no picture wider than itself.
class GuideBrowser : public QTextBrowser
{
protected:
    QVariant loadResource(int type, const QUrl &name) override
    {
        QVariant resource = QTextBrowser::loadResource(type, name);
        if (type != QTextDocument::ImageResource) {
            return resource;
        }
        auto picture = QImage::fromData(resource.toByteArray());
        const int room = viewport()->width() - 2 * Margin - verticalScrollBar()->sizeHint().width();
        const double ratio = devicePixelRatioF();
        const int width = static_cast<int>(std::min(picture.width() * 1.0, room * ratio));
        if (picture.isNull() || width <= 0) {
            return resource;
        }
        picture = picture.scaledToWidth(width, Qt::SmoothTransformation);
        picture.setDevicePixelRatio(ratio);
        return picture;
    }
};

} // namespace

GuideWindow::GuideWindow(QWidget *parent)
    : QDialog(parent)
    , m_browser(new GuideBrowser)
{
    initGuide();
    setObjectName("GuideWindow");
    setWindowTitle("Corvane Guide");
    resize(760, 620);
    m_browser->setObjectName("tb_guide");
    m_browser->setAccessibleName("Guide");
    m_browser->document()->setDocumentMargin(Margin);
    m_browser->setOpenExternalLinks(true);
    auto *row = new QHBoxLayout;
    row->setContentsMargins(6, 6, 6, 0);
    const auto add = [&](const char *icon, const char *toolTip, const QKeySequence &key) {
        auto *button = new QToolButton;
        button->setIcon(lineIcon(icon));
        button->setToolTip(QString("%1 (%2)").arg(toolTip, key.toString()));
        button->setAccessibleName(toolTip);
        button->setShortcut(key);
        button->setAutoRaise(true);
        row->addWidget(button);
        return button;
    };
    auto *back = add("step_back", "Back", QKeySequence("Alt+Left"));
    auto *forward = add("step_forward", "Forward", QKeySequence("Alt+Right"));
    auto *contents = add("home", "Contents", QKeySequence("Alt+Home"));
    row->addStretch();
    auto *layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->addLayout(row);
    layout->addWidget(m_browser);
    back->setEnabled(false);
    forward->setEnabled(false);
    connect(back, &QToolButton::clicked, m_browser, &QTextBrowser::backward);
    connect(forward, &QToolButton::clicked, m_browser, &QTextBrowser::forward);
    connect(contents, &QToolButton::clicked, this, [this] { showPage({}); });
    connect(m_browser, &QTextBrowser::backwardAvailable, back, &QWidget::setEnabled);
    connect(m_browser, &QTextBrowser::forwardAvailable, forward, &QWidget::setEnabled);
    connect(m_browser, &QTextBrowser::sourceChanged, this, &GuideWindow::scrollToHeading);
    m_browser->setFocus();
}

void GuideWindow::showPage(const QString &heading)
{
    const QString page =
        heading.isEmpty() ? "qrc:/docs/guide/index.md" : "qrc:/docs/user-guide.md#" + heading;
    m_browser->setSource(QUrl(page), QTextDocument::MarkdownResource);
}

/// The toolkit's reader of such files makes no anchors of headings.
void GuideWindow::scrollToHeading(const QUrl &source)
{
    const QTextDocument &text = *m_browser->document();
    for (QTextBlock block = text.begin(); source.hasFragment() && block.isValid();
         block = block.next()) {
        if (block.blockFormat().headingLevel() > 0 && linkName(block.text()) == source.fragment()) {
            m_browser->setTextCursor(QTextCursor(block));
            const QRectF place = text.documentLayout()->blockBoundingRect(block);
            m_browser->verticalScrollBar()->setValue(static_cast<int>(place.top()) - Margin / 2);
            return;
        }
    }
}

QStringList GuideWindow::headings()
{
    initGuide();
    QFile file(":/docs/user-guide.md");
    QStringList found;
    if (file.open(QIODevice::ReadOnly)) {
        static const QRegularExpression heading("^#+ (.*)$", QRegularExpression::MultilineOption);
        auto match = heading.globalMatch(QString::fromUtf8(file.readAll()));
        while (match.hasNext()) {
            found += linkName(match.next().captured(1));
        }
    }
    return found;
}

void setGuidePage(QWidget &window, const QString &heading)
{
    window.setProperty(PageProperty, heading);
}

QString guidePageOf(const QWidget *window)
{
    while (window != nullptr && window->property(PageProperty).toString().isEmpty()) {
        window = window->parentWidget();
    }
    return window != nullptr ? window->property(PageProperty).toString() : QString();
}
