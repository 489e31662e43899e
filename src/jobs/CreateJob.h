// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CreateRequest.h"
#include "ToolJob.h"
#include "WaveformOutput.h"

#include "dsp/CreateSignal.h"

#include <vector>

class TempStream;

/// What is known of a generated signal.
struct SignalFacts
{
    int samples = 0; ///< in the stream, repetitions included
    double clockHz = 0;
    double peak = 0; ///< linear vector length
    double rms = 0;  ///< linear
};

/// The first half of the road that preview and creation share: configure, generate, scale.
class SignalJob : public ToolJob
{
    Q_OBJECT

public:
    explicit SignalJob(CreateRequest request, QObject *parent = nullptr);

    /// Valid after the job has finished.
    [[nodiscard]] const SignalFacts &facts() const { return m_facts; }

protected:
    [[nodiscard]] const CreateRequest &request() const { return m_request; }
    [[nodiscard]] bool generate(TempStream &data);
    /// Whether scaling applies to what was generated.
    [[nodiscard]] bool isScaled() const { return m_request.autoScaling && m_facts.peak > 0; }
    [[nodiscard]] bool scale(TempStream &data, const QString &label);

private:
    CreateRequest m_request;
    CreateSignal m_engine;
    SignalFacts m_facts;
};

/// Makes a signal for looking at, with the values that 16-bit words would give.
class SignalPreviewJob : public SignalJob
{
    Q_OBJECT

public:
    using SignalJob::SignalJob;

    /// I and Q in turn.
    [[nodiscard]] const std::vector<double> &samples() const { return m_samples; }

private:
    [[nodiscard]] bool work() override;

    std::vector<double> m_samples;
};

/// Makes a signal and writes it to a waveform file.
class CreateJob : public SignalJob
{
    Q_OBJECT

public:
    explicit CreateJob(const CreateRequest &request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool work() override;
    [[nodiscard]] bool save(TempStream &data);
    void warnOfOtherClock();

    WaveformOutput m_output;
};
