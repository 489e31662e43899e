// SPDX-License-Identifier: Apache-2.0
#include "GeneratorControl.h"

#include "InstrumentIdentity.h"
#include "VisaSession.h"

#include "log/Tracer.h"

namespace {

/// A model that doesn't know a query leaves it without an answer.
constexpr quint32 AnswerMs = 1500;

std::optional<double> numberOf(const std::optional<QString> &answer)
{
    bool isNumber = false;
    const double number = answer ? answer->toDouble(&isNumber) : 0;
    return isNumber ? std::optional(number) : std::nullopt;
}

std::optional<bool> switchOf(const std::optional<QString> &answer)
{
    if (!answer) {
        return std::nullopt;
    }
    const QString word = answer->toUpper();
    const bool isOn = word == "1" || word == "ON";
    return isOn || word == "0" || word == "OFF" ? std::optional(isOn) : std::nullopt;
}

/// The text of a string in an answer.
QString textOf(QString answer)
{
    if (answer.size() < 2 || answer.front() != answer.back() ||
        (answer.front() != '"' && answer.front() != '\'')) {
        return answer;
    }
    const QString quote(answer.front());
    return answer.mid(1, answer.size() - 2).replace(quote + quote, quote);
}

} // namespace

GeneratorControl::GeneratorControl(VisaSession &session, const InstrumentIdentity &identity)
    : m_session(session)
    , m_identity(identity)
{
}

bool GeneratorControl::isGenerator() const
{
    if (!m_session.isOpen()) {
        return VisaSession::failNotOpen();
    }
    return !m_identity.isAnalyzer() || Tracer::fail(QString("The device '%1, %2' is no generator.")
                                                        .arg(m_identity.model, m_identity.serial));
}

QString GeneratorControl::arb(const QString &command) const
{
    return (m_identity.hasBasebandCoder() ? "SOUR:BB:ARB:" : "SOUR:") + command;
}

bool GeneratorControl::read(GeneratorState &state)
{
    state = {};
    if (!isGenerator()) {
        return false;
    }
    // Old errors would be taken for errors of these queries.
    (void)m_session.checkErrorQueue();
    constexpr int MostSilences = 3; // of one that has said nothing at all
    int silences = 0;
    const auto ask = [&](const QString &query) -> std::optional<QString> {
        if (silences == MostSilences) {
            return std::nullopt;
        }
        std::optional<QString> answer = m_session.ask(query, AnswerMs);
        silences = answer ? -MostSilences : silences + 1;
        return answer;
    };
    state.frequencyHz = numberOf(ask(":FREQ?"));
    state.levelDbm = numberOf(ask(":POW?"));
    state.output = switchOf(ask(":OUTP?"));
    state.waveform = textOf(ask(arb("WAV:SEL?")).value_or(QString()));
    state.arb = switchOf(ask(arb("STAT?")));
    state.clockHz = numberOf(ask(arb("CLOC?")));
    const bool isAnswered = state.arb || state.frequencyHz || state.levelDbm || state.output;
    return isAnswered || Tracer::fail("The instrument doesn't tell its state.");
}

std::optional<bool> GeneratorControl::readOutput()
{
    return switchOf(m_session.ask(":OUTP?", AnswerMs));
}

bool GeneratorControl::send(const QString &command)
{
    return m_session.send(command + "; *OPC?") && m_session.checkErrorQueue();
}

bool GeneratorControl::change(const GeneratorChange &change)
{
    if (!isGenerator()) {
        return false;
    }
    (void)m_session.checkErrorQueue();
    const auto number = [](double value) { return QString::number(value, 'g', 15); };
    return (!change.frequencyHz || send(":FREQ " + number(*change.frequencyHz))) &&
           (!change.levelDbm || send(":POW " + number(*change.levelDbm))) &&
           (!change.output || send(*change.output ? ":OUTP ON" : ":OUTP OFF"));
}

bool GeneratorControl::stop()
{
    if (!isGenerator()) {
        return false;
    }
    (void)m_session.checkErrorQueue();
    return send(arb("STAT OFF"));
}
