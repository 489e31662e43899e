// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ToolJob.h"

#include "composer/ComposerEngine.h"

/// What the Composer is to render, and how.
struct ComposeRequest
{
    Composition composition;  ///< rendered as it stands
    bool multiProcess = true; ///< several segments at a time
    bool overwrite = true;    ///< a file that stands under the target's name may be replaced
};

/// Renders a composition into its target file. What can be seen to fail is told before the work
/// begins. Progress is that of the whole run; that of its parts comes from the engine.
class ComposeJob : public ToolJob
{
    Q_OBJECT

public:
    explicit ComposeJob(ComposeRequest request, QObject *parent = nullptr);

    [[nodiscard]] const ComposerEngine &engine() const { return m_engine; }

    /// Why the work didn't begin; empty if it did.
    [[nodiscard]] const QString &refusal() const { return m_refusal; }

private:
    [[nodiscard]] bool work() override;
    /// Why there is nothing to begin with; empty if there is.
    [[nodiscard]] QString problem() const;

    ComposeRequest m_request;
    ComposerEngine m_engine;
    QString m_refusal;
};
