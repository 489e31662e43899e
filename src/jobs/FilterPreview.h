// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dsp/Resample.h"
#include "view/IqSample.h"

#include <QObject>

#include <optional>

/// Filters the first samples of a waveform, to be looked at before the whole is filtered.
///
/// The loop closes behind those samples here, so that the last ones are joined to the first and not
/// to what follows them in the file.
class FilterPreview : public QObject
{
    Q_OBJECT

public:
    static constexpr int MaxSamples = 10000;

    struct Result
    {
        IqList before; ///< as the file has them
        IqList after;  ///< filtered, at the peak level of `before`, as the filtered file will be
    };

    explicit FilterPreview(QObject *parent = nullptr);

    /// `samples` is the number of samples in the stream, of which at most MaxSamples are taken.
    /// Nothing if it was cancelled or, with the reason logged, if it failed.
    [[nodiscard]] std::optional<Result> run(BufferedIO &source, qint64 samples,
                                            const FilterSettings &settings);

    /// What a spectrum of samples is made of: in the 16 bits of a file, faded in and out, so that
    /// the ends of the list make no lines of their own.
    [[nodiscard]] static IqList spectrumInput(const IqList &samples);

public slots:
    void cancel();

private:
    Resample m_filter;
    bool m_cancelled = false;
};
