// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

#include <functional>
#include <utility>

/// Selects a waveform file of a generator, waits until it is loaded, and switches the ARB on.
class StartJob final : public InstrumentJob
{
    Q_OBJECT

public:
    static constexpr int DefaultSeconds = 100;

    /// `path` with "/" or as the instrument writes it; `seconds` is the longest wait.
    StartJob(InstrumentRef instrument, QString path, int seconds = DefaultSeconds,
             QObject *parent = nullptr);

    /// Looks before the start whether the instrument can play the waveform; by default nobody does.
    void setCheck(WaveformCheck check) { m_check = check; }

    /// Decides, with WaveformCheck::Warned, whether to start a waveform that the instrument can't
    /// play for these reasons; without one it is started.
    using Question = std::function<bool(const QStringList &problems)>;
    void setQuestion(Question question) { m_question = std::move(question); }

    /// Whether the RF output was off when the waveform was started, so that nothing leaves it. It
    /// stays as it is.
    [[nodiscard]] bool isOutputOff() const { return m_isOutputOff; }

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    [[nodiscard]] bool isFit(VisaDevice &device);

    QString m_path;
    int m_seconds;
    WaveformCheck m_check = WaveformCheck::None;
    Question m_question;
    bool m_isOutputOff = false;
};
