// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ToolJob.h"

#include "streams/TempStream.h"

#include <QString>

#include <memory>

class VisaDevice;

/// What an analyzer is to record. The starting values are those of a dialog without settings.
struct CaptureRequest
{
    enum class Input { Rf, AnalogIq, DigitalIq };
    enum class Trigger { Immediate, External, IfPower };
    enum class Slope { Positive, Negative };

    static constexpr double MinRateHz = 10e3;
    static constexpr double MaxRateHz = 326e6;
    static constexpr double MinRbwHz = 300e3;
    static constexpr double MaxRbwHz = 50e6;
    static constexpr int MinSamples = 100;
    static constexpr int MaxSamples = 209'715'200;
    static constexpr int MinPretrigger = -16'776'703;
    static constexpr int MaxPretrigger = 65'023;
    static constexpr double MinLevelDbm = -70;
    static constexpr double MaxLevelDbm = 30;

    QString resource; ///< VISA resource of the analyzer
    Input input = Input::Rf;
    double sampleRateHz = 1e6;
    int samples = 32768;
    double rbwHz = 10e6;
    int pretriggerSamples = 0; ///< before the trigger; negative: that many after it
    Trigger trigger = Trigger::Immediate;
    Slope slope = Slope::Positive;
    double triggerLevelDbm = -20; ///< of Trigger::IfPower
};

/// What an analyzer has recorded. The temporary file goes with the object.
struct Capture
{
    TempStream data; ///< "IQF" and the samples, volts of full scale as the analyzer sent them
    int samples = 0;
    double clockHz = 0; ///< the sample rate that the analyzer reported
    double peak = 0;    ///< linear, of full scale 1
    double rms = 0;     ///< likewise
    double gain = 1;    ///< by which a scaling has multiplied the samples since
    QString comment;    ///< how the analyzer was set
};

/// Has an analyzer record a piece of its signal, and reads it. The session is closed on every way
/// out; the analyzer stays in its I/Q mode after a failure in the middle.
///
/// cancel() ends the wait for the sweep at once. While the samples are read it takes effect behind
/// them, as the block can't be left in its middle.
class CaptureJob final : public ToolJob
{
    Q_OBJECT

public:
    explicit CaptureJob(CaptureRequest request, QObject *parent = nullptr);

    /// The record of a job that has finished, null otherwise.
    [[nodiscard]] std::unique_ptr<Capture> takeCapture() { return std::move(m_capture); }

protected:
    [[nodiscard]] bool work() override;

private:
    [[nodiscard]] bool record(VisaDevice &device);
    [[nodiscard]] bool selectInput(VisaDevice &device);
    [[nodiscard]] bool configure(VisaDevice &device);
    [[nodiscard]] bool readReference(VisaDevice &device);
    [[nodiscard]] bool sweep(VisaDevice &device);
    [[nodiscard]] bool waitForSweep(VisaDevice &device);
    [[nodiscard]] bool readSamples(VisaDevice &device);
    [[nodiscard]] bool measure();
    void say(const QString &text);
    [[nodiscard]] QString commentText() const;

    CaptureRequest m_request;
    std::unique_ptr<Capture> m_capture;
    double m_centerHz = 0;
    double m_attenuationDb = 0;
    double m_referenceDbm = 0;
};
