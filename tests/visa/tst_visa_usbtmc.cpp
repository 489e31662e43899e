// SPDX-License-Identifier: Apache-2.0
#include "support/files.h"
#include "support/rows.h"
#include "visa/UsbtmcDevices.h"
#include "visa/UsbtmcTransport.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QTemporaryDir>
#include <QTest>

#include <linux/usb/tmc.h>
#include <sys/ioctl.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <deque>
#include <map>

using namespace visa;

namespace {

constexpr std::uint8_t End = 1, Terminated = 2;

// What the driver was told and what it is to answer.
struct DriverState
{
    struct Answer
    {
        QByteArray data;
        std::uint8_t attributes = 0;
        int error = 0;
    };

    std::deque<Answer> answers;
    std::deque<int> writeLimits; // bytes taken by each write, or a negated errno; all when empty
    std::map<unsigned long, int> refusedRequests; // with their errno
    int openError = 0;

    QByteArrayList written; // with "$" behind what was closed by END
    std::vector<unsigned long> requests;
    std::uint32_t timeoutMs = 0;
    bool setsEnd = true;
    std::uint8_t lastAttributes = 0;
    usbtmc_termchar terminator{};
    int openCount = 0;
};

class ScriptedKernel : public UsbtmcKernel
{
public:
    explicit ScriptedKernel(DriverState &state)
        : m_state(state)
    {
    }

    int open(const std::string &) override
    {
        errno = m_state.openError;
        if (m_state.openError != 0) {
            return -1;
        }
        ++m_state.openCount;
        return 42;
    }
    void close(int) override { --m_state.openCount; }

    ssize_t read(int, void *buffer, std::size_t size) override
    {
        if (m_state.answers.empty()) {
            errno = ETIMEDOUT;
            return -1;
        }
        const auto answer = m_state.answers.front();
        m_state.answers.pop_front();
        errno = answer.error;
        if (answer.error != 0) {
            return -1;
        }
        const std::size_t count = std::min(size, std::size_t(answer.data.size()));
        std::memcpy(buffer, answer.data.data(), count);
        m_state.lastAttributes = answer.attributes;
        return ssize_t(count);
    }

    ssize_t write(int, const void *data, std::size_t size) override
    {
        int limit = int(size);
        if (!m_state.writeLimits.empty()) {
            limit = m_state.writeLimits.front();
            m_state.writeLimits.pop_front();
        }
        if (limit < 0) {
            errno = -limit;
            return -1;
        }
        QByteArray bytes(static_cast<const char *>(data), limit);
        if (m_state.setsEnd) {
            bytes += '$';
        }
        m_state.written << bytes;
        return limit;
    }

    int ioctl(int, unsigned long request, void *argument) override
    {
        m_state.requests.push_back(request);
        if (const auto refused = m_state.refusedRequests.find(request);
            refused != m_state.refusedRequests.end()) {
            errno = refused->second;
            return -1;
        }
        if (request == USBTMC_IOCTL_SET_TIMEOUT) {
            std::memcpy(&m_state.timeoutMs, argument, sizeof m_state.timeoutMs);
        } else if (request == USBTMC_IOCTL_EOM_ENABLE) {
            m_state.setsEnd = *static_cast<std::uint8_t *>(argument) != 0;
        } else if (request == USBTMC_IOCTL_CONFIG_TERMCHAR) {
            std::memcpy(&m_state.terminator, argument, sizeof m_state.terminator);
        } else if (request == USBTMC_IOCTL_MSG_IN_ATTR) {
            *static_cast<std::uint8_t *>(argument) = m_state.lastAttributes;
        }
        return 0;
    }

private:
    DriverState &m_state;
};

std::unique_ptr<Transport> openWith(DriverState &state)
{
    std::unique_ptr<Transport> transport;
    if (UsbtmcTransport::open("/dev/usbtmc0", std::make_unique<ScriptedKernel>(state), transport) !=
        VI_SUCCESS) {
        qFatal("scripted device did not open");
    }
    return transport;
}

void makeFile(const QString &path, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(path).path());
    QVERIFY(store(path, content));
}

} // namespace

/// USB instruments: the devices in sysfs, and what the driver's answers become.
class TestVisaUsbtmc : public QObject
{
    Q_OBJECT

private slots:
    void devices();
    void openErrors();
    void reads();
    void readsWithOldDriver();
    void writes();
    void timeouts();
    void terminatorNotSupported();
    void remoteControl();
};

void TestVisaUsbtmc::devices()
{
    // Two interfaces of one device, a plain one with the number 10, one without serial number.
    const QTemporaryDir root;
    const auto addDevice = [&](const QString &folder, const char *vendor, const char *serial) {
        const QString path = root.filePath("sys/devices/" + folder);
        makeFile(path + "/idVendor", vendor);
        makeFile(path + "/idProduct", "00af\n");
        if (*serial != '\0') {
            makeFile(path + "/serial", serial);
        }
    };
    const auto addNode = [&](const QString &node, const QString &interface, const char *number) {
        const QString path = root.filePath("sys/devices/" + interface);
        makeFile(path + "/bInterfaceNumber", number);
        const QString link = root.filePath("sys/class/usbmisc/" + node);
        QDir().mkpath(link);
        QVERIFY(QFile::link(path, link + "/device"));
    };
    addDevice("1-1", "7fe3\n", "100001\n");
    addNode("usbtmc2", "1-1/1-1:1.0", "00\n");
    addNode("usbtmc1", "1-1/1-1:1.1", "01\n");
    addDevice("1-2", "0abc\n", "X\n");
    addNode("usbtmc10", "1-2/1-2:1.0", "00\n");
    addDevice("1-3", "7fe3\n", "");
    addNode("usbtmc0", "1-3/1-3:1.0", "00\n");
    QDir().mkpath(root.filePath("sys/class/usbmisc/hiddev0"));
    QDir().mkpath(root.filePath("sys/class/usbmisc/usbtmc9")); // vanished meanwhile

    const auto found = findUsbtmcDevices(root.path().toStdString());
    QStringList names;
    for (const UsbtmcDevice &device : found) {
        names << QString::fromStdString(resourceText(device.name));
    }
    QCOMPARE(names, (QStringList{"USB0::0x7FE3::0x00AF::100001::1::INSTR",
                                 "USB0::0x7FE3::0x00AF::100001::0::INSTR",
                                 "USB0::0x0ABC::0x00AF::X::INSTR"}));

    const auto pathOf = [&](const char *name) {
        return QString::fromStdString(findUsbtmcPath(found, *parseResourceName(name)))
            .remove(root.path());
    };
    QCOMPARE(pathOf("USB0::0x7FE3::0xAF::100001::0"), "/dev/usbtmc2");
    QCOMPARE(pathOf("USB0::0x7FE3::0xAF::100001"), "/dev/usbtmc1");
    QCOMPARE(pathOf("USB0::0xABC::0xAF::X::INSTR"), "/dev/usbtmc10");
    QCOMPARE(pathOf("USB0::0xABC::0xAF::Y::INSTR"), QString());

    QVERIFY(findUsbtmcDevices("/nowhere").empty());
}

void TestVisaUsbtmc::openErrors()
{

    forRows({{"gone", ENOENT, int{VI_ERROR_RSRC_NFOUND}},
             {"no permission", EACCES, int{VI_ERROR_NPERMISSION}},
             {"in use", EBUSY, int{VI_ERROR_RSRC_BUSY}}},
            [](int error, int status) {
                DriverState state;
                state.openError = error;
                std::unique_ptr<Transport> transport;
                QCOMPARE(UsbtmcTransport::open("/dev/usbtmc0",
                                               std::make_unique<ScriptedKernel>(state), transport),
                         status);
                QVERIFY(!transport);
            });
}

void TestVisaUsbtmc::reads()
{
    using Answers = QList<DriverState::Answer>;
    forRows({{"end at the count", {{"abc", End}}, 3, false, VI_SUCCESS, "abc"},
             {"count", {{"abcdef", 0}}, 3, false, VI_SUCCESS_MAX_CNT, "abc"},
             {"partial", {{"ab", 0}, {"", 0}, {"c", End}}, 10, false, VI_SUCCESS, "abc"},
             {"terminator and end", {{"ab\n", Terminated | End}}, 10, true, VI_SUCCESS, "ab\n"},
             {"time-out behind data", {{"ab", 0}}, 10, false, VI_ERROR_TMO, "ab"},
             {"unplugged", {{"", 0, ENODEV}}, 10, false, VI_ERROR_CONN_LOST, ""},
             {"signal", {{"", 0, EINTR}, {"ab", End}}, 10, false, VI_SUCCESS, "ab"},
             {"nothing for ever", Answers(40, {"", 0}), 10, false, VI_ERROR_IO, ""}},
            [](QList<DriverState::Answer> answers, int size, bool hasTerminator, int status,
               QByteArray data) {
                DriverState state;
                state.answers.assign(answers.begin(), answers.end());
                const auto transport = openWith(state);
                std::vector<std::uint8_t> buffer(static_cast<std::size_t>(size));
                ReadOptions options;
                if (hasTerminator) {
                    options.terminator = '\n';
                }
                std::size_t count = 99;
                QCOMPARE(transport->read(buffer, options, Deadline::after(5000), count), status);
                QCOMPARE(QByteArray(reinterpret_cast<char *>(buffer.data()), qsizetype(count)),
                         data);
                QCOMPARE(state.terminator.term_char_enabled != 0, hasTerminator);
                const bool hasAborted = std::count(state.requests.begin(), state.requests.end(),
                                                   USBTMC_IOCTL_ABORT_BULK_IN) > 0;
                QCOMPARE(hasAborted, status == VI_ERROR_TMO);
            });
}

void TestVisaUsbtmc::readsWithOldDriver()
{
    DriverState state;
    state.refusedRequests[USBTMC_IOCTL_MSG_IN_ATTR] = ENOTTY;
    state.answers = {{"abcd", 0}, {"ef", 0}};
    const auto transport = openWith(state);
    std::vector<std::uint8_t> buffer(4);
    std::size_t count = 0;
    QCOMPARE(transport->read(buffer, {}, Deadline::after(1000), count), VI_SUCCESS_MAX_CNT);
    QCOMPARE(transport->read(buffer, {}, Deadline::after(1000), count), VI_SUCCESS);
    QCOMPARE(count, std::size_t{2});
}

void TestVisaUsbtmc::writes()
{
    DriverState state;
    const auto transport = openWith(state);
    const std::vector<std::uint8_t> data{'a', 'b', 'c', 'd'};
    std::size_t count = 0;
    QCOMPARE(transport->write(data, true, Deadline::after(1000), count), VI_SUCCESS);
    QCOMPARE(transport->write(data, false, Deadline::after(1000), count), VI_SUCCESS);
    state.writeLimits = {3, 0};
    QCOMPARE(transport->write(data, true, Deadline::after(1000), count), VI_SUCCESS);
    QCOMPARE(count, data.size());
    QCOMPARE(state.written, (QByteArrayList{"abcd$", "abcd", "abc$", "$", "d$"}));

    state.writeLimits = {1, -ETIMEDOUT};
    QCOMPARE(transport->write(data, true, Deadline::after(1000), count), VI_ERROR_TMO);
    QCOMPARE(count, std::size_t{1});
    QCOMPARE(state.requests.back(), static_cast<unsigned long>(USBTMC_IOCTL_ABORT_BULK_OUT));

    // Only the last piece of a long message carries END.
    state.written.clear();
    const std::vector<std::uint8_t> large(100'000, 'x');
    QCOMPARE(transport->write(large, true, Deadline::after(1000), count), VI_SUCCESS);
    QCOMPARE(state.written.size(), 2);
    QVERIFY(!state.written.first().endsWith('$'));
    QVERIFY(state.written.last().endsWith('$'));
    QCOMPARE(state.written.join().size(), 100'001);
}

void TestVisaUsbtmc::timeouts()
{
    DriverState state;
    const auto transport = openWith(state);
    QCOMPARE(transport->clear(Deadline::after(3000)), VI_SUCCESS);
    QVERIFY(state.timeoutMs > 2500 && state.timeoutMs <= 3000);
    QCOMPARE(transport->clear(Deadline::after(VI_TMO_IMMEDIATE)), VI_SUCCESS);
    QCOMPARE(state.timeoutMs, 100U); // the driver refuses less
    QCOMPARE(transport->clear(Deadline::after(VI_TMO_INFINITE)), VI_SUCCESS);
    QVERIFY2(state.timeoutMs < 0x8000'0000U, "the driver takes it for a negative number");
}

void TestVisaUsbtmc::terminatorNotSupported()
{
    DriverState state;
    state.refusedRequests[USBTMC_IOCTL_CONFIG_TERMCHAR] = EINVAL;
    state.answers = {{"ab", End}};
    const auto transport = openWith(state);
    std::vector<std::uint8_t> buffer(4);
    std::size_t count = 0;
    ReadOptions options;
    options.terminator = '\n';
    QCOMPARE(transport->read(buffer, options, Deadline::after(1000), count), VI_ERROR_NSUP_OPER);
    QCOMPARE(transport->read(buffer, {}, Deadline::after(1000), count), VI_SUCCESS);
}

void TestVisaUsbtmc::remoteControl()
{
    using Requests = QList<unsigned long>;
    forRows(
        {{"deassert, local", 2, Requests{USBTMC488_IOCTL_GOTO_LOCAL, USBTMC488_IOCTL_REN_CONTROL}},
         {"assert, lockout", 5,
          Requests{USBTMC488_IOCTL_REN_CONTROL, USBTMC488_IOCTL_LOCAL_LOCKOUT}}},
        [](int mode, QList<unsigned long> requests) {
            DriverState state;
            {
                const auto transport = openWith(state);
                QCOMPARE(transport->controlRemote(ViUInt16(mode), Deadline::after(1000)),
                         VI_SUCCESS);
                state.requests.erase(state.requests.begin()); // the time-out
                QCOMPARE(QList<unsigned long>(state.requests.begin(), state.requests.end()),
                         requests);
                QCOMPARE(state.openCount, 1);
            }
            QCOMPARE(state.openCount, 0);
        });
}

QTEST_APPLESS_MAIN(TestVisaUsbtmc)
#include "tst_visa_usbtmc.moc"
