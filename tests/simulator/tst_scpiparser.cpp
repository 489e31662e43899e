// SPDX-License-Identifier: Apache-2.0
#include "simulator/CommandTable.h"
#include "simulator/ErrorQueue.h"
#include "simulator/ProgramUnit.h"
#include "simulator/ScpiParser.h"
#include "support/rows.h"

#include <QTest>

#include <array>

using namespace simulator;

namespace {

// Writes down what the parser reports.
class Recorder final : public ScpiParser::Handler
{
public:
    QString events;

private:
    void onUnit(std::string_view text, bool hasBlock) override
    {
        events += QString("unit(%1)%2 ").arg(toText(text), hasBlock ? "+block" : "");
    }
    void onBlockBegin(std::string_view, std::optional<std::uint64_t> size) override
    {
        events += size ? QString("block%1(").arg(*size) : QString("block?(");
    }
    void onBlockData(std::span<const char> bytes) override
    {
        events += QString::fromLatin1(bytes.data(), static_cast<qsizetype>(bytes.size()));
    }
    void onBlockEnd(bool complete) override { events += complete ? ") " : "...) "; }
    void onError(int number) override { events += QString("error%1 ").arg(number); }
    void onMessageEnd() override { events += "end "; }

    static QString toText(std::string_view text)
    {
        return QString::fromLatin1(text.data(), static_cast<qsizetype>(text.size()));
    }
};

void noHandler(CommandContext &) {}

} // namespace

class TestScpiParser : public QObject
{
    Q_OBJECT

private slots:
    void messages();
    void unitTooLong();
    void clearEndsBlock();
    void units();
    void headers();
    void suffixes();
};

// Whatever the sizes of the pieces, the result is the same; lengths and quotes get cut everywhere.
void TestScpiParser::messages()
{

    forRows(
        {{"END ends a message", "*IDN?", "unit(*IDN?) end ", true},
         {"line feed and END are one end", "*IDN?\n", "unit(*IDN?) end ", true},
         {"two messages in one piece", "A\nB?", "unit(A) end unit(B?) end ", true},
         {"units", "A 1;*OPC?; B", "unit(A 1) unit(*OPC?) unit(B) end ", true},
         {"empty units", ";; ;A;", "unit(A) end ", true},
         {"blank message", " ", "end ", true},
         {"separators in strings", "A 'x;\"#15',\"y;#\"", "unit(A 'x;\"#15',\"y;#\") end ", true},
         {"doubled quote", "A 'x'';y'", "unit(A 'x'';y') end ", true},
         {"definite block", "A 'x',#15hello", "block5(hello) unit(A 'x',#)+block end ", true},
         {"block with separators", "A #16\n;'\"#\n;B",
          "block6(\n;'\"#\n) unit(A #)+block unit(B) end ", true},
         {"two-digit count", "A #211hello world;B",
          "block11(hello world) unit(A #)+block unit(B) end ", true},
         {"bracket count", "A #(5)hello\n", "block5(hello) unit(A #)+block end ", true},
         {"empty block", "A #10,1", "block0() unit(A #,1)+block end ", true},
         {"block of unknown length", "A #0he\nllo", "block?(he\nllo) unit(A #)+block end ", true},
         {"its terminator is no data", "A #0hello\n\n", "block?(hello\n) unit(A #)+block end ",
          true},
         {"numbers are no blocks", "A #HFF,#b1,#Q7", "unit(A #HFF,#b1,#Q7) end ", true},
         {"cut block", "A #15hel", "block5(hel...) error-161 end ", true},
         {"cut block, then more", "A #15hel;B", "block5(hel;B) unit(A #)+block end ", true},
         {"cut count", "A #3", "error-161 end ", true},
         {"bad count", "A #2x1;B", "error-161 end ", true},
         {"bad bracket", "A #();B\nC", "error-161 end unit(C) end ", true},
         {"huge bracket", "A #(9999999999999999999)\nC", "error-161 end unit(C) end ", true},
         {"open string", "A 'x;B\nC", "error-151 end unit(C) end ", true},
         {"raw: line feed ends", "*IDN?\r\n*OPT?", "unit(*IDN?\r) end ", false},
         {"raw: unknown length is refused", "A #0x\nB\n", "error-161 end unit(B) end ", false},
         {"raw: definite block", "A #12\n\n\n", "block2(\n\n) unit(A #)+block end ", false}},
        [](QByteArray bytes, QString events, bool transportHasEnd) {
            const auto length = static_cast<std::size_t>(bytes.size());
            for (const std::size_t pieceSize :
                 {length, std::size_t{1}, std::size_t{2}, std::size_t{3}}) {
                Recorder recorder;
                ScpiParser parser(recorder, transportHasEnd);
                for (std::size_t begin = 0; begin < length; begin += pieceSize) {
                    std::span<const char> piece(bytes.constData() + begin,
                                                std::min(pieceSize, length - begin));
                    const bool end = transportHasEnd && begin + pieceSize >= length;
                    while (!piece.empty()) {
                        const std::size_t used = parser.feed(piece, end);
                        QVERIFY(used > 0);
                        piece = piece.subspan(used);
                    }
                }
                QCOMPARE(recorder.events, events);
            }
        });
}

void TestScpiParser::unitTooLong()
{
    Recorder recorder;
    ScpiParser parser(recorder, true);
    const QByteArray text = "A '" + QByteArray(2 * ScpiParser::MaxUnitLength, 'x') + "'";
    QCOMPARE(parser.feed({text.constData(), static_cast<std::size_t>(text.size())}, true),
             static_cast<std::size_t>(text.size()));
    QCOMPARE(recorder.events, "error-363 end ");
    QVERIFY(parser.isIdle());
}

void TestScpiParser::clearEndsBlock()
{
    Recorder recorder;
    ScpiParser parser(recorder, true);
    const QByteArray text("A #19abc");
    (void)parser.feed({text.constData(), static_cast<std::size_t>(text.size())}, false);
    QVERIFY(!parser.isIdle());
    parser.clear();
    QVERIFY(parser.isIdle());
    (void)parser.feed(std::span<const char>("*IDN?", 5), true);
    QCOMPARE(recorder.events, "block9(abc...) unit(*IDN?) end ");
}

void TestScpiParser::units()
{
    struct Row
    {
        const char *name;
        int error;
        QString form;
    };
    forRows<Row>({{"*idn?", 0, "*IDN?"},
                  {":mmem:Cat? 'a'", 0, ":MMEM:CAT? 'a'"},
                  {"A:B 1, -2.5e3 ,.5", 0, "A:B 1 -2500 0.5"},
                  {"F 1.5MHz,2 ms,1e+07Hz", 0, "F 1.5[MHZ] 2[MS] 10000000[HZ]"},
                  {"F #HfF,#Q17,#b101", 0, "F 255 15 5"},
                  {"S 'it''s',\"a\"\"b\"", 0, "S 'it's' 'a\"b'"},
                  {"W ON,word_1", 0, "W ON word_1"},
                  {"D 'x',#", 0, "D 'x' #"},
                  {"X  \r", 0, "X"},
                  {"", CommandHeaderError, ""},
                  {"1A", CommandHeaderError, ""},
                  {"A::B", InvalidCharacter, ""},
                  {"A$", InvalidCharacter, ""},
                  {"ABCDEFGHIJKLM", MnemonicTooLong, ""},
                  {"A 1 2", InvalidSeparator, ""},
                  {"A 1,", SyntaxError, ""},
                  {"A 'x", InvalidString, ""},
                  {"A -inf", InvalidNumber, ""},
                  {"A @", InvalidCharacter, ""}},
                 [](const Row &row) {
                     ProgramUnit unit;
                     QCOMPARE(unit.parse(row.name), row.error);
                     if (row.error != 0) {
                         return;
                     }
                     QStringList nodes;
                     for (const std::string &node : unit.nodes) {
                         nodes << QString::fromStdString(node);
                     }
                     QString actual = (unit.common     ? "*"
                                       : unit.absolute ? ":"
                                                       : "") +
                                      nodes.join(':') + (unit.query ? "?" : "");
                     for (const Parameter &parameter : unit.parameters) {
                         actual += ' ';
                         switch (parameter.kind) {
                         case Parameter::Kind::Number:
                             actual += QString::number(parameter.value, 'g', 12);
                             if (!parameter.suffix.empty()) {
                                 actual += '[' + QString::fromStdString(parameter.suffix) + ']';
                             }
                             break;
                         case Parameter::Kind::String:
                             actual += '\'' + QString::fromStdString(parameter.text) + '\'';
                             break;
                         case Parameter::Kind::Block:
                             actual += '#';
                             break;
                         case Parameter::Kind::Character:
                             actual += QString::fromStdString(parameter.text);
                             break;
                         }
                     }
                     QCOMPARE(actual, row.form);
                 });
}

void TestScpiParser::headers()
{

    struct Row
    {
        const char *name;
        int place;
    };
    forRows<Row>({{"*OPC", 0},
                  {"SYST:ERR", 1},
                  {"system:error:next", 1},
                  {"SYST:ERR:NEXT:NEXT", UndefinedHeader},
                  {"SOUR:BB:STAT", 2},
                  {"SOURCE1:BB:STATE", 2},
                  {"SOUR2:BB:STAT", HeaderSuffixOutOfRange},
                  {"SOUR:BB", 3},
                  {"ANA", UndefinedHeader}},
                 [](const Row &row) {
                     static constexpr std::array Commands{
                         Command{.pattern = "*OPC", .set = noHandler},
                         Command{.pattern = "SYSTem:ERRor[:NEXT]", .query = noHandler},
                         Command{.pattern = "[:SOURce#]:BB:STATe", .set = noHandler},
                         Command{.pattern = "[:SOURce#]:BB[:LEVel]", .set = noHandler},
                         Command{.pattern = "ANAlyze", .applies = ToAnalyzer, .set = noHandler},
                     };
                     CommandTable table;
                     table.add(Commands, ToGenerator);

                     const bool common = QByteArray(row.name).startsWith('*');
                     std::vector<std::string> nodes;
                     for (const QString &node : QString(row.name).mid(common ? 1 : 0).split(':')) {
                         nodes.push_back(node.toUpper().toStdString());
                     }
                     const CommandTable::Result result = table.find(nodes, common);
                     if (row.place < 0) {
                         QVERIFY(result.command == nullptr);
                         QCOMPARE(result.error, row.place);
                     } else {
                         QCOMPARE(result.command,
                                  &Commands.at(static_cast<std::size_t>(row.place)));
                     }
                 });
}

void TestScpiParser::suffixes()
{

    forRows({{"none", "", "HZ", 1.0},
             {"MHz is mega", "MHZ", "HZ", 1e6},
             {"ms is milli", "MS", "S", 1e-3},
             {"dBm", "DBM", "DBM", 1.0},
             {"wrong unit", "KHZ", "S", 0.0},
             {"unit where none goes", "HZ", "", 0.0}},
            [](QString suffix, QString unit, double factor) {
                QCOMPARE(suffixFactor(suffix.toStdString(), unit.toStdString()), factor);
            });
}

QTEST_APPLESS_MAIN(TestScpiParser)
#include "tst_scpiparser.moc"
