// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "visa/visa.h"

#include <QList>
#include <QMutex>
#include <QString>

class VisaDevice;

/// The functions that are used of a VISA library; null where the library lacks one.
struct VisaFunctions
{
    decltype(&::viOpenDefaultRM) viOpenDefaultRM = nullptr;
    decltype(&::viStatusDesc) viStatusDesc = nullptr;
    decltype(&::viOpen) viOpen = nullptr;
    decltype(&::viClear) viClear = nullptr;
    decltype(&::viClose) viClose = nullptr;
    decltype(&::viSetAttribute) viSetAttribute = nullptr;
    decltype(&::viGetAttribute) viGetAttribute = nullptr;
    decltype(&::viSetBuf) viSetBuf = nullptr;
    decltype(&::viGpibControlREN) viGpibControlREN = nullptr;
    decltype(&::viPrintf) viPrintf = nullptr;
    decltype(&::viRead) viRead = nullptr;
    decltype(&::viWrite) viWrite = nullptr;
    decltype(&::viFindRsrc) viFindRsrc = nullptr;
    decltype(&::viFindNext) viFindNext = nullptr;
};

/// The VISA library, loaded at run time so that the program starts without one, and what all
/// instrument sessions share. VISA has no fixed place on this system; the library is
/// - the file that the environment variable CORVANE_VISA_LIBRARY names, and then no other, since a
///   wrong name must not end in talking through another maker's library;
/// - else the first that loads of: "visa32", "visa" where the system looks for libraries, and the
///   workbench's own "corvane_visa" beside the program or where it is installed.
class VisaLibrary
{
public:
    static VisaLibrary &instance();

    /// Looks for a library and loads it. Logs which one was taken, or why none could be. A library
    /// once loaded stays in the process.
    [[nodiscard]] bool load();

    [[nodiscard]] bool isLoaded() const { return m_isLoaded; }

    /// The library's functions, if it is loaded and has all those named; null, with the reason
    /// logged, otherwise.
    template <typename... Function>
    [[nodiscard]] const VisaFunctions *functions(Function VisaFunctions::*...needed) const
    {
        return checked(((m_functions.*needed != nullptr) && ...));
    }

    /// The library's functions as they are, for callers with words of their own.
    [[nodiscard]] const VisaFunctions &all() const { return m_functions; }

    /// The same, to be exchanged; for tests.
    [[nodiscard]] VisaFunctions &editFunctions() { return m_functions; }

    /// The library's text for a status; empty, with the reason logged, if it can't give one.
    [[nodiscard]] QString statusText(ViObject object, ViStatus status) const;

    /// Loads the library and opens its resource manager. Returns why that failed; empty if it
    /// didn't. The caller holds the mutex.
    [[nodiscard]] QString openManager();

    /// Closes the resource manager if there is one. The caller holds the mutex.
    void closeManager();

    /// Guards the two members below and the calls viOpen and viFindRsrc.
    QMutex mutex;
    ViSession manager = VI_NULL; ///< of viOpenDefaultRM, 0 while there is none
    QList<VisaDevice *> devices; ///< all that live, in order of their making

private:
    VisaLibrary() = default;

    [[nodiscard]] const VisaFunctions *checked(bool allResolved) const;

    bool m_isLoaded = false;
    VisaFunctions m_functions;
};
