// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <optional>

struct InstrumentIdentity;
class VisaSession;

/// What a generator does. Nothing stands for what it doesn't tell.
struct GeneratorState
{
    QString waveform;                  ///< path of the selected waveform; empty: none is
    std::optional<bool> arb;           ///< whether the waveform is played
    std::optional<double> clockHz;     ///< of the waveform
    std::optional<double> frequencyHz; ///< of the RF output
    std::optional<double> levelDbm;    ///< of the RF output
    std::optional<bool> output;        ///< whether the RF output is on
};

/// What is to be set on the RF side of a generator; nothing stays as it is.
struct GeneratorChange
{
    static constexpr double MinFrequencyHz = 1;
    static constexpr double MaxFrequencyHz = 1e12;
    static constexpr double MinLevelDbm = -200;
    static constexpr double MaxLevelDbm = 100;

    std::optional<double> frequencyHz{};
    std::optional<double> levelDbm{};
    std::optional<bool> output{};
};

/// The ARB and the RF side of a generator. Lives for one operation of a session. The operations
/// are those of VisaDevice.
class GeneratorControl
{
public:
    GeneratorControl(VisaSession &session, const InstrumentIdentity &identity);

    [[nodiscard]] bool read(GeneratorState &state);
    [[nodiscard]] std::optional<bool> readOutput();
    [[nodiscard]] bool change(const GeneratorChange &change);
    [[nodiscard]] bool stop();

private:
    [[nodiscard]] bool isGenerator() const;
    [[nodiscard]] bool send(const QString &command);
    [[nodiscard]] QString arb(const QString &command) const;

    VisaSession &m_session;
    const InstrumentIdentity &m_identity;
};
