// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <QList>
#include <QtGlobal>

#include <array>
#include <vector>

class BufferedIO;

/// The stretch of a long waveform that a viewing tool shows: its place, its length by a ladder of
/// zoom steps, and its samples, of which a move reads only the new ones.
///
/// Failures are told once in the log; the window then holds no samples, and the next successful
/// show reads all of them anew. To be used in one thread, without widgets.
class ViewWindow
{
public:
    static constexpr std::array<int, 11> ZoomLadder{50,   100,   200,   500,   1000,  2000,
                                                    5000, 10000, 20000, 50000, 100000};
    static constexpr int DefaultPoints = 5000;

    /// Binds the data and the marker stream of a waveform, neither of which is owned, and goes to
    /// its start. Between the calls the streams may be read elsewhere;
    /// invalidate must follow when they were written.
    void setSource(BufferedIO *data, BufferedIO *markers, qint64 sampleCount);

    /// Takes the markers from another stream, with the window where it is.
    void setMarkers(BufferedIO *markers);

    /// Forgets source and samples.
    void release() { setSource(nullptr, nullptr, 0); }

    /// Forgets the samples, so that the next show reads them anew.
    void invalidate();

    [[nodiscard]] qint64 sampleCount() const { return m_sampleCount; }
    [[nodiscard]] qint64 first() const { return m_first; }
    /// Number of samples shown, at most those of the waveform.
    [[nodiscard]] int points() const { return m_points; }
    [[nodiscard]] const IqList &samples() const { return m_samples; }
    [[nodiscard]] const QList<quint8> &markers() const { return m_markers; }

    /// Moves to a first sample and reads what is missing. False if that fails, or without a
    /// message if the window would reach beyond the end of the waveform: it then stays.
    [[nodiscard]] bool show(qint64 first);

    /// The next step of the ladder below or above the present length, about the same middle or with
    /// sample `kept` of the waveform at the same place of the view.
    [[nodiscard]] bool zoomIn(qint64 kept = -1);
    [[nodiscard]] bool zoomOut(qint64 kept = -1);

    /// `count` samples about the middle of the view, or as many as the waveform has, with the
    /// position of the first one; empty, with the reason logged, if they can't be read.
    [[nodiscard]] IqList around(qint64 count, qint64 &first);

    /// Starts that the move commands lead to; `show` takes them. Below 0 becomes 0.
    [[nodiscard]] qint64 reverse() const { return bounded(m_first - m_points); }
    [[nodiscard]] qint64 forward() const { return m_first + m_points; }
    [[nodiscard]] qint64 reverseLittle() const { return bounded(m_first - littleStep()); }
    [[nodiscard]] qint64 forwardLittle() const { return m_first + littleStep(); }
    [[nodiscard]] qint64 end() const { return bounded(m_sampleCount - m_points); }
    /// The start of a view with this sample in its middle, within the waveform.
    [[nodiscard]] qint64 centredOn(qint64 sample) const;
    /// A step of the playback: a little one, in whole spectrum frames where it is long enough, so
    /// that their transforms are used again.
    [[nodiscard]] qint64 playStep() const;
    /// Where the playback goes next; the present start once the end is reached.
    [[nodiscard]] qint64 playTarget() const { return qMin(m_first + playStep(), end()); }

private:
    /// A read of a stream fetches a block of 16 MiB anyway; keeping a larger piece of it than the
    /// window shows spares most moves the read.
    static constexpr qint64 PageSamples = 1 << 19;

    struct Page
    {
        qint64 from = 0;
        std::vector<float> iq; ///< interleaved
        std::vector<quint8> markers;
    };

    struct Range
    {
        qint64 from;
        qint64 count;
    };

    [[nodiscard]] qint64 littleStep() const { return qMax<qint64>(m_points / 20, 1); }
    [[nodiscard]] static qint64 bounded(qint64 first) { return qMax<qint64>(first, 0); }
    [[nodiscard]] bool setPoints(int points, qint64 kept);
    [[nodiscard]] bool isShowable(qint64 first) const;
    [[nodiscard]] bool slide(qint64 first);
    [[nodiscard]] bool loadPage(const Range &range);
    [[nodiscard]] bool read(const Range &range, IqList &samples, QList<quint8> &markers);

    BufferedIO *m_data = nullptr;
    BufferedIO *m_markerStream = nullptr;
    qint64 m_sampleCount = 0;
    qint64 m_first = 0;
    int m_points = 0;
    qint64 m_heldFirst = 0; ///< position of the first held sample
    Page m_page;
    IqList m_samples;
    QList<quint8> m_markers;
};
