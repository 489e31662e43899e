// SPDX-License-Identifier: Apache-2.0
#include "DlgComposer.h"

#include "CWidgetTrackEdit.h"
#include "formfields.h"

#include "appearance/lineicon.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QShortcut>
#include <QVBoxLayout>

QPushButton *DlgComposer::addButton(QLayout *row, const char *objectName, const char *icon,
                                    const char *text, const char *toolTip,
                                    const std::function<void()> &action)
{
    auto *button = named(objectName, new QPushButton(QString::fromLatin1(text), this));
    button->setToolTip(QString::fromLatin1(toolTip));
    button->setAccessibleName(QString::fromLatin1(toolTip));
    if (*icon != 0) {
        button->setIcon(lineIcon(QString::fromLatin1(icon)));
    }
    button->setAutoDefault(false);
    connect(button, &QPushButton::clicked, this, action);
    row->addWidget(button);
    return button;
}

void DlgComposer::buildWindow()
{
    auto *layout = new QVBoxLayout(this);
    layout->addLayout(insertRow());
    layout->addWidget(m_tracks, 1);
    layout->addLayout(viewRow());
    layout->addLayout(documentRow());
    // The fields are made before the rows that they stand in.
    const auto order = [](const QList<QWidget *> &widgets) {
        for (int i = 1; i < widgets.size(); ++i) {
            setTabOrder(widgets.at(i - 1), widgets.at(i));
        }
    };
    const auto button = [this](const char *name) {
        return findChild<QWidget *>(QLatin1String(name));
    };
    order({le_wvname, button("pb_select")});
    order({pb_undo, m_tracks, button("pb_start")});
    order({button("pb_csr_begin"), le_csr_sample, le_csr_time, button("pb_csr_end")});
}

QLayout *DlgComposer::insertRow()
{
    auto *row = new QHBoxLayout;
    row->addWidget(new QLabel(QStringLiteral("Waveform"), this));
    le_wvname->setAccessibleName(QStringLiteral("Waveform to insert"));
    row->addWidget(le_wvname, 1);
    addButton(row, "pb_select", "", "...", "Select the Waveform to Insert", [this] {
        slot_wvselect();
    })->setMaximumWidth(36);
    row->addSpacing(8);
    addButton(row, "pb_insert", "insert", "Insert", "Insert at the Cursor, Moving What Follows",
              [this] { slot_insert(); });
    addButton(row, "pb_overwrite", "overwrite", "Overwrite", "Replace What Lies Behind the Cursor",
              [this] { slot_overwrite(); });
    addButton(row, "pb_extract", "extract", "Extract",
              "Remove the Segments at the Cursor, Closing the Gap", [this] { slot_extract(); });
    addButton(row, "pb_lift", "lift", "Lift", "Remove the Segments at the Cursor, Leaving a Gap",
              [this] { slot_lift(); });
    pb_undo = addButton(row, "pb_undo", "undo", "Undo", "Undo the last Action",
                        [this] { m_tracks->popUndo(); });
    pb_undo->setMinimumWidth(fontMetrics().horizontalAdvance(QStringLiteral("Undo (256)")) +
                             pb_undo->iconSize().width() + 32);
    return row;
}

QLayout *DlgComposer::viewRow()
{
    auto *row = new QHBoxLayout;
    addButton(row, "pb_start", "jump_start", "", "Show the Beginning",
              [this] { m_tracks->moveStart(); });
    addButton(row, "pb_zoomin", "zoom_in", "", "Zoom In", [this] { m_tracks->zoomIn(); });
    addButton(row, "pb_zoomout", "zoom_out", "", "Zoom Out", [this] { m_tracks->zoomOut(); });
    addButton(row, "pb_zoomfit", "zoom_fit", "", "Show All", [this] { m_tracks->zoomFit(); });
    addButton(row, "pb_end", "jump_end", "", "Show the End", [this] { m_tracks->moveEnd(); });
    row->addStretch(1);
    row->addWidget(l_duration);
    row->addSpacing(12);
    row->addWidget(l_rate);
    row->addStretch(1);
    row->addWidget(new QLabel(QStringLiteral("Cursor"), this));
    addButton(row, "pb_csr_begin", "cursor_start", "", "Cursor to the Beginning",
              [this] { m_tracks->setCsrBegin(); });
    row->addWidget(le_csr_sample);
    row->addWidget(new QLabel(QStringLiteral("Cursor Time"), this));
    row->addWidget(le_csr_time);
    addButton(row, "pb_csr_end", "cursor_end", "", "Cursor to the End",
              [this] { m_tracks->setCsrEnd(); });
    for (QtNumericEdit *field : {le_csr_sample, le_csr_time}) {
        field->setFixedWidth(fontMetrics().horizontalAdvance(QStringLiteral("888.888888 ms")) + 16);
    }
    for (const char *name : {"pb_start", "pb_zoomin", "pb_zoomout", "pb_zoomfit", "pb_end",
                             "pb_csr_begin", "pb_csr_end"}) {
        constexpr int IconButtonWidth = 34;
        findChild<QPushButton *>(QLatin1String(name))->setMaximumWidth(IconButtonWidth);
    }
    return row;
}

QLayout *DlgComposer::documentRow()
{
    auto *row = new QHBoxLayout;
    addButton(row, "pb_addtrack", "track_add", "Add Track", "Add an Empty Track",
              [this] { slot_addtrack(); });
    addButton(row, "pb_deltrack", "track_delete", "Delete Track", "Delete the Selected Tracks",
              [this] { slot_deltrack(); });
    addButton(row, "pb_clearall", "delete", "Clear All", "Delete Everything",
              [this] { slot_clearall(); });
    row->addStretch(1);
    addButton(row, "pb_settings", "settings", "Settings", "Clock, Length and File of the Target",
              [this] { m_tracks->targetSettings(); });
    addButton(row, "pb_load", "open", "Load", "Load a Composition (Ctrl+O)",
              [this] { slot_load(); });
    addButton(row, "pb_save", "save", "Save", "Save the Composition (Ctrl+S)",
              [this] { slot_save(); });
    row->addStretch(1);
    addButton(row, "pb_create", "render", "Create", "Render the Waveform",
              [this] { slot_create(); });
    addButton(row, "pb_close", "close", "Close", "Close the Window", [this] { close(); });
    return row;
}

void DlgComposer::addKeys()
{
    const auto key = [this](const QKeySequence &sequence, const std::function<void()> &action) {
        connect(new QShortcut(sequence, this), &QShortcut::activated, this, action);
    };
    key(Qt::CTRL | Qt::Key_Z, [this] { m_tracks->popUndo(); });
    key(Qt::CTRL | Qt::Key_Y, [this] { m_tracks->redo(); });
    key(Qt::CTRL | Qt::SHIFT | Qt::Key_Z, [this] { m_tracks->redo(); });
    key(Qt::CTRL | Qt::Key_S, [this] { slot_save(); });
    key(Qt::CTRL | Qt::Key_O, [this] { slot_load(); });
}
