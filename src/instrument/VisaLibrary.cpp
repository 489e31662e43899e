// SPDX-License-Identifier: Apache-2.0
#include "VisaLibrary.h"

#include "log/Tracer.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>
#include <QLibrary>
#include <QStringList>

#include <array>

namespace {

/// Names for the loader, in the order in which they are tried.
QStringList candidates()
{
    const QString chosen = qEnvironmentVariable("CORVANE_VISA_LIBRARY");
    if (!chosen.isEmpty()) {
        return {chosen};
    }
    QStringList names{"visa32", "visa"};
    // Beside the program, in the bin folder of a build whose tests stand elsewhere, and where an
    // installation puts libraries.
    constexpr const char *OwnFolder = CORVANE_LIBRARY_FOLDER "/corvane";
    for (const char *folder :
         {".", "../bin", OwnFolder, CORVANE_LIBRARY_FOLDER, "../lib/corvane", "../lib"}) {
        const QString name = QDir::cleanPath(QCoreApplication::applicationDirPath() + "/" + folder +
                                             "/libcorvane_visa.so");
        if (QFileInfo::exists(name) && !names.contains(name)) {
            names.append(name);
        }
    }
    // Whatever the loader's own search path offers.
    names.append("corvane_visa");
    return names;
}

template <typename Function>
void resolve(QLibrary &library, Function &function, const char *name)
{
    function = reinterpret_cast<Function>(library.resolve(name));
}

VisaFunctions resolveAll(QLibrary &library)
{
    VisaFunctions functions;
    resolve(library, functions.viOpenDefaultRM, "viOpenDefaultRM");
    resolve(library, functions.viStatusDesc, "viStatusDesc");
    resolve(library, functions.viOpen, "viOpen");
    resolve(library, functions.viClear, "viClear");
    resolve(library, functions.viClose, "viClose");
    resolve(library, functions.viSetAttribute, "viSetAttribute");
    resolve(library, functions.viGetAttribute, "viGetAttribute");
    resolve(library, functions.viSetBuf, "viSetBuf");
    resolve(library, functions.viGpibControlREN, "viGpibControlREN");
    resolve(library, functions.viPrintf, "viPrintf");
    resolve(library, functions.viRead, "viRead");
    resolve(library, functions.viWrite, "viWrite");
    resolve(library, functions.viFindRsrc, "viFindRsrc");
    resolve(library, functions.viFindNext, "viFindNext");
    return functions;
}

} // namespace

VisaLibrary &VisaLibrary::instance()
{
    static VisaLibrary theLibrary;
    return theLibrary;
}

bool VisaLibrary::load()
{
    QStringList reasons;
    for (const QString &name : candidates()) {
        // The loader would wait for ever for the other end of a pipe.
        if (const QFileInfo file(name); file.exists() && !file.isFile() && !file.isDir()) {
            reasons.append(QString("'%1' is not a regular file").arg(name));
            continue;
        }
        QLibrary library(name);
        if (library.load()) {
            Tracer::Trace(Tracer::Information,
                          QString("Using VISA library '%1'").arg(library.fileName()));
            m_functions = resolveAll(library);
            m_isLoaded = true;
            if (m_functions.viOpenDefaultRM == nullptr) {
                Tracer::Trace(Tracer::Warning,
                              QString("'%1' is no VISA library.").arg(library.fileName()));
            }
            return true;
        }
        reasons.append(library.errorString());
    }
    m_functions = {};
    m_isLoaded = false;
    Tracer::Trace(Tracer::Warning,
                  QString("No VISA library could be loaded: %1").arg(reasons.join("; ")));
    return false;
}

QString VisaLibrary::openManager()
{
    manager = VI_NULL;
    if (!load()) {
        return "The VISA library cannot be loaded.";
    }
    if (m_functions.viOpenDefaultRM == nullptr || m_functions.viStatusDesc == nullptr) {
        return "Cannot resolve functions in VISA Library.";
    }
    const ViStatus status = m_functions.viOpenDefaultRM(&manager);
    if (status >= VI_SUCCESS) {
        return {};
    }
    manager = VI_NULL;
    return "The viOpenDefaultRM() failed: " + statusText(VI_NULL, status);
}

void VisaLibrary::closeManager()
{
    if (m_isLoaded && manager != VI_NULL && m_functions.viClose != nullptr) {
        m_functions.viClose(manager);
    }
    if (m_isLoaded) {
        manager = VI_NULL;
    }
}

const VisaFunctions *VisaLibrary::checked(bool allResolved) const
{
    if (!m_isLoaded) {
        Tracer::Trace(Tracer::Error, "VISA Library is not loaded.");
        return nullptr;
    }
    if (!allResolved) {
        Tracer::Trace(Tracer::Error, "Cannot resolve functions in VISA Library.");
        return nullptr;
    }
    return &m_functions;
}

QString VisaLibrary::statusText(ViObject object, ViStatus status) const
{
    const VisaFunctions *visa = functions(&VisaFunctions::viStatusDesc);
    if (visa == nullptr) {
        return {};
    }
    // Larger than the 256 characters that VISA promises not to exceed.
    std::array<char, 1024> text{};
    visa->viStatusDesc(object, status, text.data());
    text.back() = '\0';
    return QString::fromLatin1(text.data());
}
