// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RemoteFileEntry.h"

#include "base/OutputFile.h"

#include <QList>
#include <QObject>
#include <QString>
#include <QStringList>

#include <functional>
#include <memory>
#include <optional>

class BufferedIO;
struct ArbIntervals;
struct GeneratorChange;
struct GeneratorState;
struct InstrumentIdentity;

/// One instrument: the one face of its VISA session, its identity, its files, the block transfers
/// and the start of waveforms, each of which is a class of its own.
///
/// Every operation that returns bool is true on success; the reason of a failure is in the log.
/// What the instrument itself reported gathers until takeLastError(). A closed device fails with
/// "Device is not open.", any device without a library with "VISA Library is not loaded."
///
/// A device belongs to one thread. Calls block until the instrument answers or the time-out (5 s
/// unless set) is over; transfers, tree operations and the wait for the ARB let the event loop run
/// every 100 ms, in which ProgressUpdate() goes out and cancel() comes in. The caller must keep the
/// user from starting something else on the same device meanwhile.
class VisaDevice : public QObject
{
    Q_OBJECT

public:
    /// A yes-or-no question to the user; true is yes.
    using Question = std::function<bool(const QString &title, const QString &text)>;

    enum ScanKind {
        ScanGpib = 0,
        ScanUsb = 1,
    };

    /// The first of all living devices loads the library, unless `noVisa`; what failed is then told
    /// by takeLastError().
    explicit VisaDevice(bool noVisa = false, QObject *parent = nullptr);
    ~VisaDevice() override;

    // Session

    /// Opens, configures and identifies. cancel() ends the wait for a host. On failure nothing
    /// stays open; an open device is left alone.
    [[nodiscard]] bool openResource(const QString &resource);
    /// Also true when nothing is open. The identity stays.
    bool closeResource();
    [[nodiscard]] bool isOpen() const;
    /// Sends a command; if it holds "*OPC?", waits for the answer 1.
    [[nodiscard]] bool sendCommand(const QString &command);
    /// Sends a query (nothing when empty) and reads the answer, its white space collapsed. Also
    /// false when the error queue holds an error; the answer is delivered all the same.
    [[nodiscard]] bool queryText(const QString &command, QString &answer);
    /// Takes up to 20 entries out of the instrument's error queue; true when there was no error.
    bool checkErrorQueue();
    /// The errors that the instrument has reported, one a line, which are then forgotten.
    [[nodiscard]] QString takeLastError();
    bool setTimeoutMs(quint32 milliseconds);
    /// 0 if it can't be told.
    [[nodiscard]] quint32 timeoutMs() const;
    /// VI_ATTR_INTF_TYPE; 1 is GPIB.
    [[nodiscard]] bool interfaceType(quint16 &type) const;
    /// Logs the library's words for a status.
    void reportStatus(qint32 status) const;
    /// Whether the user's input is let through while an instrument is being opened. For a caller
    /// that has made sure that nothing but a cancel can come of it, as by a modal dialog.
    void setTakesInput(bool takesInput);
    /// Whether another device has a session with this instrument.
    [[nodiscard]] bool isOpenElsewhere(const QString &model, const QString &serial) const;

    /// The same by the resource, before the instrument has told who it is.
    [[nodiscard]] bool isResourceOpenElsewhere(const QString &resource) const;

    // Identity and capabilities; they stay after closing

    [[nodiscard]] const InstrumentIdentity &identity() const;
    [[nodiscard]] QString vendor() const;
    [[nodiscard]] QString model() const;
    [[nodiscard]] QString serial() const;
    [[nodiscard]] QString firmware() const;
    [[nodiscard]] QString resource() const;
    /// The answer to "*OPT?".
    [[nodiscard]] QString options() const;
    /// "TCPIP", "GPIB0" and so on.
    [[nodiscard]] QString interfaceName() const;
    [[nodiscard]] bool isUnixFileSystem() const;
    [[nodiscard]] QChar pathSeparator() const;
    [[nodiscard]] bool hasBasebandCoder() const;
    [[nodiscard]] bool isAnalyzer() const;
    [[nodiscard]] QStringList rootDirectories() const;
    /// Range in Hz of RF path 1 or 2; false when there is no such path.
    [[nodiscard]] bool rfFrequencyRange(int path, double &lower, double &upper) const;
    /// Memory in samples, clock and bandwidth in Hz of baseband 1 or 2; false when there is none.
    [[nodiscard]] bool basebandCapabilities(int index, int &size, int &clock, int &bandwidth) const;
    /// Tries all instruments of a kind (ScanKind) that the library finds. Those that answer and are
    /// supported come as closed devices, which the caller owns. cancel() ends it after the present
    /// one, with what was found so far in the list and false.
    [[nodiscard]] bool scanResources(QList<VisaDevice *> &found, int kind);

    // Transfers

    /// Instrument to local file. After a failure a file that was there is as it was before, and
    /// none is new.
    /// A file that stands under the local name may also be one that is to be kept.
    [[nodiscard]] bool
    readRemoteFile(const QString &remotePath, const QString &localPath,
                   OutputFile::Existing existing = OutputFile::Existing::Replaced);
    /// The first bytes of a remote file, at most `maximum`.
    [[nodiscard]] bool readRemoteHead(const QString &remotePath, qint64 maximum, QByteArray &head);
    /// Local file to instrument; replaces a file there. After a failure there is none.
    [[nodiscard]] bool writeRemoteFile(const QString &localPath, const QString &remotePath);
    /// Reads the block that a command sent before has asked for, of at most `maximum` bytes; the
    /// stream then holds "IQF" and the data. Can't be cancelled and lets no events through.
    [[nodiscard]] bool readBinaryBlock(BufferedIO *stream, qint64 maximum);

    /// Ends the block in whose middle the instrument sits after a broken write, and brings session
    /// and instrument back to order. The arguments are the value to restore of VI_ATTR_SEND_END_EN,
    /// and the interface type.
    void recoverAfterTransferError(quint16 previousEnd, quint16 interfaceKind);

    // Files and folders of the instrument

    /// Names that begin with a point are left out. A folder that isn't there may look empty.
    [[nodiscard]] bool listDirectory(QList<RemoteFileEntry> &entries, const QString &path);
    /// All files below a folder with their whole size in bytes.
    [[nodiscard]] bool listTree(QStringList &files, qint64 &totalSize, const QString &directory);
    /// All files and folders below a folder; the names are their paths below it, with "/".
    [[nodiscard]] bool listTreeEntries(QList<RemoteFileEntry> &entries, const QString &directory);
    /// True also when there is no such file, or the user was asked and said no.
    [[nodiscard]] bool deleteRemoteFile(const QString &path, bool ask);
    /// Asks for deleteRemoteFile; without one the answer is no.
    void setQuestion(Question question);
    [[nodiscard]] bool makeDirectory(const QString &parent, const QString &name);
    [[nodiscard]] bool renameEntry(const QString &directory, const QString &oldName,
                                   const QString &newName);
    [[nodiscard]] bool removeDirectory(const QString &parent, const QString &name);
    /// Removes a folder that holds nothing but folders.
    [[nodiscard]] bool removeEmptyTree(const QString &parent, const QString &name);
    /// Removes a folder with all it holds. cancel() ends it between two files.
    [[nodiscard]] bool removeTree(const QString &parent, const QString &name);

    // Playing a waveform

    /// Selects a waveform file, waits until it is loaded, and switches the ARB on.
    [[nodiscard]] bool startArb(const QString &path, int seconds = DefaultArbSeconds);
    /// Polls the instrument once a second.
    [[nodiscard]] bool waitForArbReady(int seconds);
    static constexpr int DefaultArbSeconds = 100;
    /// Switches the ARB off. The RF output stays as it is.
    [[nodiscard]] bool stopArb();
    /// What the generator plays and how its RF side is set. False if it can't be asked.
    [[nodiscard]] bool readState(GeneratorState &state);
    /// Whether the RF output is on; nothing if the instrument doesn't tell.
    [[nodiscard]] std::optional<bool> readOutput();
    /// Sets what the change names, the output last.
    [[nodiscard]] bool changeState(const GeneratorChange &change);
    /// Other times than those of real instruments.
    void setArbIntervals(const ArbIntervals &intervals);

public slots:
    /// Ends the running operation at its next tick; one that starts later knows nothing of it.
    void cancel();

signals:
    void ProgressUpdate(int iPercentage);

private:
    struct Parts;
    std::unique_ptr<Parts> m_parts;
};
