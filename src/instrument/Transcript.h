// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QtGlobal>

/// The record of what was said to instruments and what they answered, for the whole program and
/// all its sessions: one line each with the time in ms since the start, ">>" to the instrument or
/// "<<" from it, and the text. Blocks stand as their length. Each line is in the file at once, so
/// that it shows where a program hangs.
class Transcript
{
public:
    /// Begins a record behind what the file holds. False, with the reason logged, if the file can't
    /// be written.
    [[nodiscard]] static bool start(const QString &fileName);

    static void stop();
    [[nodiscard]] static bool isRunning();

    static void sent(const QString &text);
    static void received(const QString &text);

    /// What stands in a line for a block.
    [[nodiscard]] static QString blockText(qint64 bytes);
};
