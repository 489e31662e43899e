// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PreviewRunner.h"

#include "jobs/CreateRequest.h"

#include <QTimer>
#include <QWidget>

#include <functional>

class CWidgetIQTrace;
class CWidgetSpectrum;
class QLabel;
class SignalPreviewJob;

/// Shows what the fields beside it would make: trace and spectrum, and samples, clock and crest, or
/// the reason why nothing can be made. Takes the room that it is given, and stays empty in too
/// little of it.
class SignalSketch : public QWidget
{
    Q_OBJECT

public:
    /// `makeRequest` reads the fields.
    explicit SignalSketch(std::function<CreateRequest()> makeRequest, QWidget *parent = nullptr);

    /// Draws anew in a moment; several calls in a row count as one.
    void request() { m_delay.start(); }

    /// Ends a drawing that is under way.
    void cancel();

protected:
    void resizeEvent(QResizeEvent *event) override;
    void hideEvent(QHideEvent *event) override;

private:
    [[nodiscard]] bool hasRoom() const;
    void draw();

    std::function<CreateRequest()> m_makeRequest;
    PreviewRunner m_runner;
    SignalPreviewJob *m_job = nullptr; ///< while one runs
    QTimer m_delay;
    QWidget *m_content;
    CWidgetIQTrace *m_trace;
    CWidgetSpectrum *m_spectrum;
    QLabel *m_facts;
};
