#include "host/stepFixture.h"
#include "metrics/tMeasured.h"
#include "text/words.h"
#include "traces/moments.h"
#include "traces/tRecording.h"
#include "traces/tableRow.h"

using namespace dravikHost;

namespace {

tRecording readTraceOf(const std::string& text, const tReadOptions& options = {})
{
    return readRecording(tTestFile("trace", text).path, options);
}

// Behind the name of the file; "" if it is read.
std::string refusalOf(const std::string& text, const tReadOptions& options = {})
{
    const tTestFile file("trace", text);
    try {
        (void)readRecording(file.path, options);
    } catch (const std::runtime_error& error) {
        const std::string why = error.what();
        const size_t at = why.find(file.path);
        return at == std::string::npos ? why : why.substr(at + file.path.size());
    }
    return "";
}

struct tReadRow {
    const char *name, *text;
    size_t count;
    double firstNs; // the first error
    double latestNs;
    int64_t elapsedNs; // from the first to the last
    const char* source;
    const char* unread = ""; // the lines not used, and why the first of them are not
    int64_t events = 0;
};

std::string unreadOf(const tRecording& recording)
{
    std::string text;
    for (const auto& [number, why] : recording.firstUnread)
        text += fmt::format("{}{} {}", text.empty() ? "" : ", ", number, why);
    return text.empty() ? "" : std::to_string(recording.unreadLines) + ": " + text;
}

// What is read, with the sign that is positive for a clock that is ahead.
const tReadRow kRead[] = {
    {"ptp4l",
     "ptp4l[10.250]: master offset -23 s2 freq +5 path delay 500\nptp4l[11.250]: port 1: "
     "UNCALIBRATED to SLAVE\nptp4l[11.300]: a sentence that ends in an offset 9 s2 freq +5 path "
     "delay 500\nptp4l[11.500]: master offset 7 s2 freq +5 path delay 500\n",
     2, -23, 7, 1'250'000'000, "ptp4l", "", 2},
    {"behind a date, an instance",
     "2024-05-06 10:11:00.123 ptp4l[6.202]: selected /dev/ptp1 as PTP clock\n"
     "2024-05-06 10:11:08.750 ptp4l[6.829]: [ptp4l.1.config:6] master offset -4 s2 freq +0\r\n"
     "2024-05-06 10:11:09.751 ptp4l[7.829]: [ptp4l.1.config:6] master offset -5 s2 freq +0\r\n",
     2, -4, -5, 1'000'000'000, "ptp4l ptp4l.1.config", "", 1},
    {"a journal's own stamp",
     "[ 24.066123] h phc2sys[716]: [23.5] CLOCK_REALTIME phc offset 4 s2 freq +1 delay 2\n"
     "[ 25.266123] h phc2sys[716]: [24.5] CLOCK_REALTIME phc offset 5 s2 freq +1 delay 2\n",
     2, 4, 5, 1'000'000'000, "phc2sys CLOCK_REALTIME"},
    {"a journal in JSON",
     "{\"MESSAGE\":\"[24.5] swp3 sys offset 4 s2 freq +1\",\"SYSLOG_IDENTIFIER\":\"phc2sys\"}\n", 1,
     4, 4, 0, "phc2sys swp3"},
    {"ts2phc",
     "ts2phc[27.133]: adding tstamp 21.94 to clock /dev/ptp3\n"
     "ts2phc[27.133]: /dev/ptp3 offset 640 s2 freq +5112\n",
     1, 640, 640, 0, "ts2phc /dev/ptp3", "", 1},
    {"damaged lines",
     "p[1.0]: master offset 1 s2 freq +5 path delay 5\np[2.0]: master offset 1 sX freq +5 path "
     "delay 5\np[3.0]: master offset 1x s2 freq +5 path delay 5\np[4.0]: master offset 1 s2 freq "
     "+\np[5.0]: master offset 1 s2 freq +5\np[6.0]: master off\np[7\np[0.5]: master offset 9 s2 "
     "freq +5 path delay 5\np[8.0]: master offset 2 s2 freq +5 path delay 5\np[0.7]: master offset "
     "9 s2 freq +5 path delay 5\np[9.0]: master offset 3 s2 freq +5 path delay 5\n",
     3, 1, 3, 8'000'000'000, "p",
     "8: 2 an unknown state, 3 the offset is no number, 4 the frequency is no number"},
    {"refclocks.log",
     "   Date (UTC) Time         Refid  DP L P  Raw offset   Cooked offset      Disp.\n"
     "2026-02-28 23:59:59.500000 PPS0    0 N 1  4.900000e-07  2.300000e-08  1.000e-06\n"
     "2026-02-28 23:59:59.500000 PPS0    - N -       -       -6.741777e-07  1.000e-06\n"
     "2026-02-30 00:00:00.500000 PPS0    1 N 1  4.900000e-07  1.500000e-08  1.000e-06\n"
     "2026-03-01 00:00:00.750000 PPS0    1 N 1  4.900000e-07 -1.500000e-08  1.000e-06\n",
     2, -23, 15, 1'250'000'000, "PPS0", "1: 4 field 1, '2026-02-30', is not what it should be", 1},
    {"statistics.log of two versions",
     "2017-08-31 16:27:19 192.0.2.1 4e-06  3.391e-05 5e-06  9e-07  9e-04 4.9e-04 3 0 3\n"
     "2017-08-31 16:27:21 192.0.2.1 3e-06 -5.693e-06 2e-06 -4e-07  2e-05 1.4e-03 4 0 3  0.00\n",
     2, 33'910, -5'693, 2'000'000'000, "192.0.2.1"},
    {"measurements.log",
     "2019-09-05 06:34:59 a::1 N 2 111 111 1111 10 10 0.66 -3.572e-03 6e-02 1e-06 3e-04 7e-03 "
     "C0000265 4B K K\n2019-09-05 06:35:59 a::1 N 2 111 101 0000 10 10 0.66 0e-00 6e-02 0e-00 "
     "0e-00 0e-00 C0000265 4B K K\n2019-09-05 06:36:59 a::1 N 2 111 111 1111 9 9 0.6 0e-00 0e-00 "
     "0e-00 0e-00 0e-00 C0000265 4B Kd? K\n2019-09-05 06:37:59 a::1 N 2 111 111 1111 9 9 0.6 0e-00 "
     "0e-00 0e-00 0e-00 0e-00 C0000265 KKKKK\n2019-09-05 06:38:59 a::1 N 2 111 111 1111 9 9 0.6 "
     "0e-00 0e-00 0e-00 0e-00 0e-00 C000026\n",
     1, 3'572'000, 3'572'000, 0, "a::1",
     "3: 3 field 19, 'Kd?', is not what it should be, 4 field 18, 'KKKKK', is not what it should "
     "be, 5 field 17, 'C000026', is not what it should be",
     1},
    {"tracking.log over servers",
     "2021-11-20 19:14:48 192.0.2.31 3 -764.414 0.056 -1.303e-04 N 1 2e-04 4e-05 6e-03 1e-03 "
     "5e-03\n2021-11-20 19:15:00 192.0.2.31 3 -764.414 0.056 -9.303e-04 ? 1 2e-04 4e-05 6e-03 "
     "1e-03 5e-03\n2021-11-20 19:31:53 192.0.2.32 3 -764.418 0.096 -4.869e-04 N 1 3e-04 7e-05 "
     "9e-03 1e-03 5e-03\n2021-11-20 19:32:53 192.0.2.32 3 -764.418 0.096 -4.869e-0\n",
     2, -130'300, -486'900, 1'025'000'000'000, "",
     "1: 4 field 7, '-4.869e-0', is not a number as it should be", 1},
    {"loopstats at midnight",
     "50935 86390.031 0.000006019 13.778190 0.000351733 0.013380 6\n"
     "50936 54.031 -0.000006319 13.778290 0.000351733 0.013380 6\n",
     2, -6'019, 6'319, 64'000'000'000, ""},
    {"loopstats of old", "50935 75440.031 0.000006019 13.778190 6\n", 1, -6'019, -6'019, 0, ""},
    {"peerstats", "48773 10847.650 PPS(0) 961a -0.001605376 0.000000000 0.001424877 0.000958674\n",
     1, 1'605'376, 1'605'376, 0, "PPS(0)"},
    {"sfptpd",
     "\n2016-03-03 10:04:41.413263 [ptp1->system(em1)], offset: 12.375, freq-adj: 1.5, in-sync: 1\n"
     "2016-03-03 10:04:42.413263 [ptp1->system(em1)], offset: 12.3\n",
     1, 12.375, 12.375, 0, "ptp1->system(em1)", "1: 3 cut short"},
    {"ptpd",
     "# Timestamp, State, Clock ID, One Way Delay, Offset From Master, Slave to Master\n"
     "2015-06-11 13:20:12.123456, lstn, , , , \n"
     "2015-06-11 13:20:13.123456, slv, 0011/01,  0.000010234,  0.000000123,  0.000010000, S\n"
     "2015-06-11 13:20:14.123456, slv, 0011/01,  0.000010234,  0.0000001\n",
     1, 123, 123, 0, "", "1: 4 cut short", 1},
    {"CSV of spreadsheets",
     "\xef\xbb\xbf\"Reference_NS\" ; Clock_NS ; note\r\n1700000000000000000 ; "
     "\"1700000000000000023\" ;\r\n1700000001000000000,5;1700000000999999999,25;clock_ns;\r\n",
     2, 23, -1.25, 1'000'000'000, ""},
    {"TIE with units", "# time [ms]  TIE [us]\n0 1.5\n125 -2\n", 2, 1500, -2000, 125'000'000, ""},
    {"TIE with decimal commas", "time (s);TIE (ns)\n0,000;11,5\n0,125;13\n0,250;\n", 2, 11.5, 13,
     125'000'000, "", "1: 4 no numbers"},
    {"rows unlike their header", "time (s);TIE (ns)\n0 11.5\n1 13\n", 2, 11.5, 13, kSecondNs, ""},
    {"an offset with its unit",
     "when,timestamp,offset_us\na,2024-05-06T10:00:00Z,12\nb,2024-05-06T10:00:01Z,-14\n", 2, 12'000,
     -14'000, 1'000'000'000, ""},
    {"phase with a header",
     "File: a.phd\nType: Phase\nTau: 0.5\n# Header End\n1.2e-9\n# Tau: 2\n-0.9e-9\n", 2, 1.2, -0.9,
     500'000'000, ""},
    {"frequency with a header", "# Type: Frequency\n# Tau: 2\n3e-9\n-4e-9\n", 3, 0, -2,
     4'000'000'000, ""},
    {"breaks in a line, before the delay was told",
     "p[1.0]:\np[2.0]: a sys offset 1 s2 freq +5 pat\np[3.0]: a sys offset 1 s3 adj +5 del\n"
     "p[4.0]: a sys offset 1 s2 freq +5 path delay\np[5.0]: b c d e f offset 2 s0 adj +5 x\n"
     "p[6.0]: b c d e f offset 3 s3 freq +5\np[7.0]: b c d e f offset 4 s2 freq +5 delay 3\n"
     "p[8.0]: b c d e f offset 5 s2 freq +5\n",
     3, 2, 4, 2 * kSecondNs, "p b c d e f", "4: 2 cut short, 3 cut short, 4 cut short", 1},
    {"damage to each number",
     "[1.0] master offset 1 s2 freq +5 path delay 5\n[2.0] offset 1 s4 freq +5 path delay 5\n"
     "[3.0] offset 1e1 s2 freq +5 path delay 5\n[4.0] offset 1 s2 freq 5e1 path delay 5\n"
     "[5.0] offset 1000000000000000000 s2 freq 5 path delay 5\n"
     "[6.0] offset 999999999999999 s2 freq +5 path delay 5\n",
     2, 1, 999'999'999'999'999, 5 * kSecondNs, "ptp4l",
     "4: 2 an unknown state, 3 the offset is no number, 4 the frequency is no number"},
    {"words missing",
     "p[1.0]: [a:10] : offset 1 s2 freq +5\np[2.0]: [a:10] : offset\np[3.0]: [a:10] : offset 1 x\n"
     "p[4.0]: [a:10] : offset 1 x freq\np[5.0]: offset 1 x y\np[6.0]: offset 1 x y z\n",
     1, 1, 1, 0, "p a:10", "3: 2 cut short, 3 cut short, 4 cut short", 2},
    {"lines of nobody", "p[1.0]: offset 1 s2 freq +5\nx\n[7 8\n7]\n[7]\n-- Logs begin\na: b\n: \n",
     1, 1, 1, 0, "p", "4: 2 no measurement, 3 no measurement, 4 no measurement", 2},
    {"a container's log in JSON",
     "{\"log\":\"\",\"message\":\"offset 4 s2 freq +1\",\"_PID\":\"7\"}\n"
     "{\"log\":\"grep.log:/usr/sbin/ts2phc.1@x-_[24.5]: offset 5 s2 freq +1\"}\n",
     1, 5, 5, 0, "ts2phc.1@x-_", "1: 1 no time in front of it"},
    {"what is no program",
     "7p[1.5]: eth0 sys offset 1 s2 freq +1\n[ 2.5 ] eth0 sys offset 2 s2 freq +1\n"
     "a(b) [2.75] eth0 sys offset 2 s2 freq +1\n [9] [3.5] eth0 sys offset 3 s2 freq +1 [4.5]\n",
     4, 1, 3, 2 * kSecondNs, "phc2sys eth0"},
    {"late lines, an outlier and a restart",
     "p[5.0]: offset 1 s2 freq 5\np[4.0]: offset 2 s2 freq 5\np[4.0]: offset 3 s2 freq 5\n"
     "p[3.0]: offset 4 s2 freq 5\np[6.0]: offset 5 s2 freq 5\np[6.0]: offset 6 s2 freq 5\n"
     "p[1.0]: offset 7 s2 freq 5\np[1.5]: offset 8 s2 freq 5\np[1.25]: offset 9 s2 freq 5\n",
     4, 1, 8, 2 * kSecondNs, "p", "5: 3 time does not advance, 2 time goes back, 4 time goes back"},
    {"a prefix of five words",
     "===\nNov 23 08:35:26 host c: 2026-02-28 23:59:59.5 PPS0 0 N 1 4.9e-07 2.3e-08 1.0e-06\na b "
     "abcdefghij abcd-fghij abcdefg-ij abcd-fg-i 2026-02-28 23:59:59.6 PPS0 0 N 1 4.9e-07 2.3e-08 "
     "1.0e-06\n2026-03-01 00:00:00.75 PPS0 1 N 1 4.9e-07 1.0e+09 1.0e-06\n2026-03-01 00:00:01.75 "
     "PPS0 1 N 1 4.9e-07 1.5e-08 1.0e-06 x\n   Date (UTC) Time     IP Address   Std dev'n Est "
     "offset\n",
     1, -23, -23, 0, "PPS0", "3: 3 no date, 4 no measurement, 5 more fields than there should be",
     1},
    {"optional fields that end",
     "2021-11-20 19:14:48 h 3 -7.4 0.5 -1.3e-04 N 1 2e-04 4e-05\n2021-11-20 19:14:49 h 3 -7.4 0.5 "
     "-1.3e-04 N\n2021-11-20 19:14:50 h 3 -7.4 0.5 -1.3e-04 N 1 2e-04\n2021-11-20 19:14:51 h 3 "
     "-7.4 0.5 -1.3e-04 ? 1\n2021-11-20 19:14:52 h 3 -7 0.5e1 -1.3e-04 N 1\n",
     1, -130'000, -130'000, 0, "", "4: 2 cut short, 3 cut short, 4 cut short"},
    {"sfptpd beside itself",
     "2016-03-03 10:04:41.4 ptp1: selected\n2016-03-03 10:04:42.4 a b\nptp1: x\n"
     "2016-03-03 10:04:43.4 [a->b], offset:  -2.5 , adj: 1.5\n2016-03-03 [a->b], offset: 2.5, x\n"
     "2016-03-03 10:04:44.4 [ab], offset: 2.5, x\n2016-03-03 10:04:45.4 [a->b], offset: 1e18, x\n",
     1, -2.5, -2.5, 0, "a->b", "5: 2 no measurement, 3 no measurement, 5 no date and time", 1},
    {"ptpd in seconds, or both",
     "1434028813.5, slv, c, 1.0, 2.5, 3.0\n2015-06-11 13:20:14, 1434028814.5, slv, c, 1.0, 3.5, "
     "3.0\n1434028815.5, slv, c, 1.0, 2.5\n1434028816.5, slv, c, 1.0, 2, 3\n1434028817.5, slv\nx, "
     "slv, c, 1.0, 2.5, 3\n1434028818.5, pasv, c\n",
     2, 2.5e9, 3.5e9, 500'000'000, "",
     "4: 3 cut short, 4 the offset is no number, 5 no measurement", 1},
    {"CSV with what spreadsheets add",
     "clock_ns,reference_ns,step_ns,elapsed_s\n,, ;\n# x\n1005,1000,-2,10,,\n"
     "clock_ns,reference_ns,step_ns,elapsed_s\n2005,2000,,10.5,,x\n2005,2000,1\n2005,2000,x,11\n"
     "-1,2000,,12\n3,1,,13.5\n",
     2, 5, 2, 3'500'000'000, "",
     "4: 6 not as many fields as the header has, 7 not as many fields as the header has, "
     "8 no number in true_error_ns, step_ns or frequency_ppb"},
    {"CSV with what is no number",
     "reference_ns,clock_ns,step_ns,true_error_ns,frequency_ppb\n1,1,1.0,,\n2,2,,n/"
     "a,\n3,3,,,nan\n4,4,,,\n",
     1, 0, 0, 0, "",
     "3: 2 no number in true_error_ns, step_ns or frequency_ppb, 3 no number in true_error_ns, "
     "step_ns or frequency_ppb, 4 no number in true_error_ns, step_ns or frequency_ppb"},
    {"CSV that is cut in its last time",
     "kind,value,call,clock_ns,reference_ns\npair,,,99,100\npair,,,210,200.5\npair,,,310,30\n"
     "x,,,310,300\ncall,x,getTime,,\ncall,1,got,,\npair,,,1012,1000\n",
     3, -1, 12, 900, "",
     "4: 4 cut short, 5 a row of the unknown kind 'x', 6 no call that is known"},
    {"comments that say something",
     "# Unit = us\n# TAU0=0.25\n# Type: Phase\n#\n! tau (s)\n1\n-2\n# Tau: 7\n", 2, 1000, -2000,
     250'000'000, ""},
    {"one Tau after another", "Tau: 1\nTau 1.0000009\nphase (ns)\n7\n8\n", 2, 7, 8, 1'000'000'900,
     ""},
    {"a remark", "Tau: 1\nnote a=b\n1\n2\n", 2, 1e9, 2e9, kSecondNs, "",
     "1: 2 in front of the first row"},
    {"dates alone",
     "2024-05-06T10:00:00Z 12e-9\n2024-05-06 10:00:01 x\n2024-05-06T10:00:02 -3e-9\n", 2, 12, -3,
     2 * kSecondNs, "", "1: 2 no numbers"},
    {"days", "date,mjd,tie [ns]\n60000.25,1,1\n60000.75,1,2\n", 2, 1, 2, 500'000'000, ""},
    {"modified Julian days", "mjd,tie [ps]\n60000.25,1000\n60000.75,2000\n", 2, 1, 2,
     43'200 * kSecondNs, ""},
    {"picoseconds", "note,t/ps,tie_ms\na,-1e12,1\nb,500000000000.4,2\nb\nc,1,x\n", 2, 1e6, 2e6,
     1'500'000'000, "", "2: 4 cut short, 5 no numbers"},
    {"UTC",
     "time (utc);phase error (us)\n2024-05-06T10:00:00Z;1\n2024-05-06 10:00:00.25;2,5\n1;1;1\n", 2,
     1000, 2500, 250'000'000, "", "1: 4 no numbers"},
    {"too much", "-0.2500000004 -0.5\n9.5e9 1\n1 -1e9\n8.5e9 0.25\n", 2, -0.5e9, 0.25e9,
     8'500'000'000'250'000'000, "", "2: 2 no time in the column of the time, 3 an error of years"}};

TEST(Trace, isReadByWhatItsLinesAre)
{
    for (const tReadRow& row : kRead) {
        SCOPED_TRACE(row.name);
        const tRecording recording = readTraceOf(row.text);
        ASSERT_EQ(row.count, recording.pairs.size());
        EXPECT_NEAR(row.firstNs, recording.pairs.front().errorNs, 1e-6);
        EXPECT_NEAR(row.latestNs, recording.pairs.back().errorNs, 1e-6);
        EXPECT_EQ(row.elapsedNs, recording.pairs.back().elapsedNs);
        EXPECT_EQ(row.source, recording.source);
        EXPECT_EQ(row.unread, unreadOf(recording));
        EXPECT_EQ(row.events, recording.events);
    }
}

// The rate that was given to the clock, and the steps.
TEST(Trace, tellsTheCorrections)
{
    const auto first = [](const char* text) { return readTraceOf(text).pairs.front(); };
    const tRecordedPair tracking = first("2021-11-20 19:14:48 h 3 -764.414 0.056 -1.303e-04\n");
    EXPECT_NEAR(764'414, *tracking.orderedPpb, 1e-6);
    EXPECT_EQ(130'300, tracking.stepNs); // slewed away before the next line
    const tRecordedPair loopstats = first("50935 75440.031 0.000006019 13.778190 6\n");
    EXPECT_NEAR(13'778.19, *loopstats.orderedPpb, 1e-6);
    const tRecordedPair held =
        first("kind,reference_ns,clock_ns,call,value\npair,1000000000,1000000023,,\ncall,,,"
              "setFrequency,7\nheld,,,setFrequency,9\nheld,,,stepTime,-23\n");
    EXPECT_EQ(7, held.orderedPpb); // what was held back reached no clock
    EXPECT_EQ(0, held.stepNs);
    for (const int state : {0, 1, 2, 3}) {
        const tRecordedPair pair =
            readTraceOf("[1.0] sys offset -23.5 s" + std::to_string(state) + " freq -5.5 delay 1\n")
                .pairs.front();
        EXPECT_EQ(state == 1 ? 24 : 0, pair.stepNs) << state;
        EXPECT_EQ(state >= 2, *pair.locked) << state;
        EXPECT_EQ(5.5, pair.orderedPpb);
        EXPECT_EQ(-24, static_cast<int64_t>(pair.clockNs - pair.referenceNs));
    }
    const tRecordedPair coasted = first(
        "kind,elapsed_s,reference_ns,clock_ns,call,value\npair,1,1,1,,\ncall,1,,,setFrequency,8\n"
        "call,1,,,setFrequency,100\ncall,2.5,,,setFrequency,40\npair,6,6,6,,\n");
    EXPECT_EQ(58, coasted.orderedPpb); // 1.5 s of the one and 3.5 s of the other
    const tRecording ours = readTraceOf(
        "kind,reference_ns,clock_ns,frequency_ppb,step_ns,call,value\n"
        "call,,,,,getMaxFrequencyOffset,50\ncall,,,,,getMinFrequencyOffset,-50\n"
        "call,,,,,getFrequency,3\ncall,,,,,getFrequency,4\npair,0,0,,,,\n"
        "pair,1,1,,,,\ncall,,,,,setFrequency,50\npair,2,2,,-6,,\npair,3,3,,,,\n"
        "call,,,,,setFrequency,-50\npair,4,4,,,,\npair,5,5,,,,\ncall,,,,,setFrequency,49\n"
        "pair,6,6,8,,,\npair,7,7,,,,\ncall,,,,,stepTime,-9\ncall,,,,,setFrequency,-49\n");
    ASSERT_EQ(8U, ours.pairs.size());
    const double kPpb[] = {3, 50, 50, -50, -50, 49, 8, -49};
    for (size_t i = 0; i < 8; ++i) {
        EXPECT_EQ(kPpb[i], ours.pairs[i].orderedPpb) << i;
        EXPECT_EQ(i == 2 ? -6 : i == 7 ? -9 : 0, ours.pairs[i].stepNs) << i;
        EXPECT_EQ(i == 7, ours.pairs[i].locked) << i;
    }
}

struct tRefusedRow {
    const char* text;
    const char* why; // a part of it
};
const tRefusedRow kRefused[] = {
    {"", " is empty"},
    {"hello world\n", " is no trace of a known kind; it begins with 'hello world'"},
    {"reference_ns,clock_ns\n",
     " looks like CSV with reference_ns and clock_ns, but has no measurement; it begins with"},
    {"reference_ns,clock\n", " is no trace of a known kind; it begins with 'reference_ns,clock'"},
    {"reference_ns,clock_ns,reference_ns\n1,2,3\n", "the column reference_ns stands there 2 times"},
    {"reference_ns,clock_ns\n1.7E+18,1.7E+18\n", "a spreadsheet has rounded away"},
    {"reference_ns,clock_ns\nx,1\n", "not used are lines 2 (no number in reference_ns"},
    {"elapsed_s,reference_ns,clock_ns\nx,1,2\n", "(elapsed_s is not a time"},
    {"0,1,2\n1,2,3\n", " is no trace of a known kind"},
    {"reference_ns,clock_ns\n1,2\nclock_ns,reference_ns\n1,2\n", "a second header"},
    {"Frequency\n1\n2\n", "names no time error that is known"},
    {"2016-03-03 10:04:41.4 [a->b], offset: 12,375, freq-adj: 1,5\n", "the offset is no number"},
    {"time,offset\n0,1\n1,2\n", "the column 'offset' does not tell its unit"},
    {"Time (s),Phase (rad)\n0,1\n1,2\n", "the unit 'rad' of its header is none of time"},
    {"Time (s),Frequency (Hz)\n0,1\n1,2\n", "names no time error that is known"},
    {"Time,TIE (ns),Phase (ns)\n0,1,2\n", "two columns may be the error"},
    {"1\n2\n", "no time, and no --interval"},
    {"   Date (UTC) Time     IP Address   Std dev'n Est offset  Offset sd  Diff freq\n",
     " looks like chrony's statistics.log, but has no measurement"},
    {"Timestamp, a, b, c, d\n", " is no trace of a known kind"},
    {"phc2sys[1.x]: phc offset 6 s2 freq -4 delay 3\n", "no time in front of it"},
    {"Tau: 1\n1\n\n2,5\nx\n", "line 4 is not one number"},
    {"2021-11-20 19:15:00 h 3 -1.4 0.056 -9.303e-04 ?  1 2.0e-04 4.0e-05\n", "(not synchronised)"},
    {"a\n\n b\tc\x7f\nd\ne\n", " begins with 'a', ' b c?', 'd'"},
    {"2026-02-28 23:59:59.5 PPS0 1 Q\n", "looks like chrony's refclocks.log"},
    {"2026-02-28 23:59:59.5 PPS0 x\n", " cannot be read: no column of its header is a time"},
    {"Date (UTC) Freq ppm\n2021-11-20 19:15:00 h 3 -1.4 0.056 -9.303e+10\n2021-11-20 19:15:01 h i\n"
     "2021-11-20 19:15:01 h 3 -1.4 0.056 -9.303e+ 3\n2021-11-20 19:15:02 h 3 q y z\n",
     "tracking.log, but has no measurement; not used are lines 2 (no measurement), 3 (field 4, "
     "'i', "
     "is not a number as it should be), 4 (field 7, '-9.303e+', is not a number as it should be)"},
    {"Tau: 1\nTau: 1.0000011\n1\n2\n", "its Tau of 1.0000011 s is not the interval given"},
    {"Tau: 1\n1\n1e9\n", "line 3 is an error of years"},
    {"0= 1 2 3\n", " is no trace of a known kind"},
    {"Tau: 0\n1\n2\n", "no time, and no --interval"},
    {"Tau: 1\n0 1\n1 2\n", "it has a Tau and more than one column"},
    {"Unit: V\n1\n", "its unit 'V' is none of time"},
    {"Time (V),TIE (ns)\n0,1\n", "the unit 'v' of its header is none of time"},
    {"# t (s) V (ns)\n0 1\n", "header, '# t (s) V (ns)', names no time error that is known"}};

// Lines of each kind, and lines that are almost of one.
const std::pair<const char*, const char*> kKinds[] = {
    {"lines of ptp4l", "CLOCK_REALTIME rms 3 max 4 freq +1\na offset 3 s2 freq +1"},
    {"chrony's rtc.log", "2015-07-22 05:40:50 -0.03 1 -0.03 -37.9 12 5 120\n x : RTC fast (s)"},
    {"chrony's selection.log",
     "2022-05-01 02:01:20 a * ----- 377 1.0 4e+01 -1e-04 1e-04\nS EOpts Reach"},
    {"chrony's tempcomp.log",
     "2015-04-19 10:39:48  2.8e+04  3.6e-01\nTemp.        Comp.\nDate Temp. Comp."},
    {"what 'chronyc tracking' prints", "Reference ID    : C0000201 (a)\nLast offset     : x"},
    {"what 'chronyc sources' prints", "^* a 2 +/- 3us\n#  +/-\nMS Name/IP address"},
    {"what 'chronyc sourcestats' prints", "Name/IP Address NP NR"},
    {"what 'ntpq -p' prints", " remote  refid  st t when poll reach"},
    {"ntpd's rawstats", "50928 2132.5 192.0.2.1 192.0.2.20 3102453281.58 3102453281.58 3.5 3.5"},
    {"ntpd's sysstats", "50928 3600.2 3600 1 2 3 4 5 6 7 8"},
    {"ntpd's clockstats: ", "49213 525.624 127.127.4.1 93 226 00:08:29.606 D"},
    {"ntpd's clockstats or another", "50928 3600.2 a zz"},
    {"ntpshmmon's", "# ntpshmmon version 1\nsample NTP2 1 2 3"},
    {"ppstest's", "trying PPS source\nfound PPS source\nsource 0 - assert 1.5, sequence: 5"},
    {"phc_ctl's", "phc_ctl[4117.187]: offset from CLOCK_REALTIME is -37ns\nsudo phc_ctl: x"},
    {"pmc's", "\tsending: GET X\na 0 RESPONSE MANAGEMENT\noffsetFromMaster 3\nmaster_offset 3"},
    {"journalctl -o json-pretty", "\t\"__REALTIME_TIMESTAMP\" : \"1\""},
    {"journalctl -o export", "__CURSOR=a\n__REALTIME_TIMESTAMP=1"},
    {"settings of a network device", "sys.a 1\nTime stamping parameters for eth0"},
    {"a web page", "<!DOCTYPE html>\n<html>"},
    {"compressed; give '", "\x1f\x8b\x08\n\xfd\x37zXZ\n\x28\xb5\x2f\xfd\nBZh9"},
    {"an archive", "PK\x03\x04"},
    {"a journal", "LPKSHHRH"},
    {"text in UTF-16", "\xfe\xff\n\xff\xfe"},
    {"a program", "\x7f\x45LF"},
    {"", "a offset 3 s2 frq 4\na offset x s2 freq 4\n[1.5 offset 3 s2 freq 4\n[1.5] offset 3 s2 "
         "freq 4\na rms 3 mux 4 freq\na rms x max 4 freq\na rms 3 max 4\nLast offset\na : b\nx* a "
         "+/- 3us\n^y a +/- 3us\n^*a  +/- 3us\n^* a\n^* \nName/IP Address x\nx NP\n remote  refid  "
         "st\nremote reach \nrefid reach\n50928 3600.2 127.127.4.1 9624 0.5\n50928 x 127.127.4.1 "
         "93 226\n50928 3600.2 a 9624\n50928 3600.2 1.5 zz\nsample NTP2 1 2\n2022-05-01 02:01:20 a "
         "* --1-- 377 1.0 4e+01 -1e-04 1e-04\nsource 0\n assert \nmsn 127.127. x"}};

TEST(Trace, isRefusedByWhatItIs)
{
    for (const tRefusedRow& row : kRefused) {
        const std::string why = refusalOf(row.text);
        EXPECT_NE(std::string::npos, why.find(row.why)) << row.text << why;
    }
    for (const auto& [kind, text] : kKinds) {
        for (std::string_view rest = text; !rest.empty();) {
            const std::string line(takeLine(rest));
            const std::string why = refusalOf(line);
            const bool isKnown = why.find(" is ") == 0 && why.find(" is no trace") != 0;
            EXPECT_EQ(*kind != '\0', isKnown) << line << why;
            EXPECT_TRUE(!isKnown || why.find(kind) == 4) << line << why;
        }
    }
    EXPECT_EQ(0U, refusalOf("a\nMS Name/IP address\n<html>\nb\n<html>\n").find(" is a web page"));
    const std::string longest(1'048'576, 'x');
    EXPECT_NE(std::string::npos, refusalOf(longest + "\n\n" + longest).find("no trace of a known"));
    EXPECT_NE(std::string::npos, refusalOf(longest + "x").find(" has a line of more than 1 MiB"));
}

TEST(Trace, doesNotMixFormats)
{
    const char* const kTracking = "2015-04-19 10:39:{} h 3 -1.4 0.056 -9.303e-04\n";
    const char* const kDaemon = "p[{}.5]: offset 1 s2 freq +1\n";
    const char* const kLoop = "50935 {}.031 0.06 13.7 6\n";
    const char* const kClock = "49213 {}.6 127.127.4.1 93 226\n";
    const struct {
        const char *line, *other; // the seconds in between
        int lines, others;
        const char* why;
    } kRows[] = {{kTracking, kDaemon, 4, 3, " mixes "},
                 {kTracking, kDaemon, 4, 2, ""},
                 {kTracking, kDaemon, 10, 12, " mixes chrony's tracking.log with"},
                 {kLoop, kClock, 3, 3, " is mostly ntpd's clockstats"},
                 {kLoop, kClock, 4, 3, ""},
                 {kLoop, kClock, 1, 2, ""}};
    for (const auto& row : kRows) {
        std::string text;
        for (int i = 0; i < row.lines + row.others; ++i)
            text += fmt::format(fmt::runtime(i < row.lines ? row.line : row.other), 10 + i);
        EXPECT_EQ(0U, (refusalOf(text) + " ").find(*row.why ? row.why : " "))
            << text << refusalOf(text);
    }
}

TEST(Trace, namesOnlySomeOfManySources)
{
    const std::string line = " offset 1 s2 freq +1 delay 1\n";
    std::string many;
    for (int i = 0; i < 20'000; ++i)
        many += "phc2sys[1.5]: eth" + std::to_string(i) + " sys" + line;
    const std::string why = refusalOf(many);
    EXPECT_NE(std::string::npos, why.find("and 19990 others"));
    EXPECT_LT(why.size(), 500U);
    const std::string two = "phc2sys[1.5]: eth1 sys" + line + "phc2sys[1.5]: eth2 sys" + line;
    for (const char* const source : {"phc2sys eth2", "h2"})
        EXPECT_EQ("phc2sys eth2", readTraceOf(two, {source, {}, {}}).source);
    EXPECT_NE("", refusalOf(two, {"eth", {}, {}}));
}

// Runs of a program one after the other are one source, side by side they are two.
TEST(Trace, tellsRunsOfAProgramApart)
{
    const auto line = [](int process, int second) {
        return "host phc2sys[" + std::to_string(process) + "]: [" + std::to_string(second) +
               ".5] CLOCK_REALTIME phc offset " + std::to_string(second) + " s2 freq +1 delay 1\n";
    };
    const tRecording restarted = readTraceOf(line(7, 10) + line(7, 11) + line(8, 20) + line(8, 21) +
                                             line(9, 15) + line(10, 25));
    ASSERT_EQ(6U, restarted.pairs.size());
    EXPECT_EQ(11 * kSecondNs, restarted.pairs[3].elapsedNs);
    EXPECT_EQ(11 * kSecondNs + 1, restarted.pairs[4].elapsedNs);
    EXPECT_EQ(21 * kSecondNs + 1, restarted.pairs[5].elapsedNs);
    EXPECT_FALSE(restarted.pairs[2].beginsStretch);
    EXPECT_TRUE(restarted.pairs[4].beginsStretch); // as time went back
    const std::string summary = "host phc2sys[6]: [9.5] CLOCK_REALTIME rms 3 max 4 freq +1 +/- 3\n";
    const tRecording after = readTraceOf(summary + line(7, 10) + line(7, 11));
    EXPECT_EQ(2U, after.pairs.size());
    EXPECT_EQ(std::vector<std::string>{"1 summaries are left out"}, after.notes);
    const std::string why = refusalOf(line(7, 10) + line(8, 10) + line(7, 11) + line(8, 11));
    EXPECT_NE(std::string::npos, why.find("'phc2sys CLOCK_REALTIME (host 7)', "
                                          "'phc2sys CLOCK_REALTIME (host 8)'"));
}

// Time that goes back for good begins a stretch, across which nothing is computed.
TEST(Trace, beginsAStretchAfterAReboot)
{
    std::string text;
    const auto add = [&text](int second, int offset) {
        text +=
            fmt::format("ptp4l[{}.0]: master offset {} s2 freq +1 path delay 1\n", second, offset);
    };
    for (int i = 0; i < 5; ++i)
        add(1000 + i, 10);
    for (int i = 0; i < 8; ++i)
        add(50 + i, -10);
    tRecording recording = readTraceOf(text);
    ASSERT_EQ(13U, recording.pairs.size());
    EXPECT_TRUE(recording.pairs[5].beginsStretch);
    EXPECT_GT(recording.pairs[5].elapsedNs, recording.pairs[4].elapsedNs);
    const tMeasured measured = measure(recording, {});
    EXPECT_EQ(8U, measured.series.phase.size());
    EXPECT_DOUBLE_EQ(1, measured.series.interval);
    keepLongestStretch(recording);
    ASSERT_EQ(8U, recording.pairs.size());
    EXPECT_FALSE(recording.pairs.front().beginsStretch);
    EXPECT_EQ(7 * kSecondNs, recording.pairs.back().elapsedNs);
    keepLongestStretch(recording); // now it is all
    EXPECT_EQ(std::vector<std::string>{"only the longest stretch is used, 8 of 13 measurements"},
              recording.notes);
    EXPECT_EQ(0, recording.pairs.front().elapsedNs);
    EXPECT_EQ(-10, recording.pairs.front().errorNs);
}

// A journal says so between the lines, though time may go on.
TEST(Trace, beginsAStretchWhereAJournalSaysSo)
{
    const std::string before = "ptp4l[1.0]: master offset 1 s2 freq +1 path delay 1\n";
    const std::string after = "ptp4l[9.0]: master offset 2 s2 freq +1 path delay 1\n"
                              "ptp4l[9.5]: master offset 2 s2 freq +1 path delay 1\n";
    for (const char* const line : {"-- Reboot --\n", "-- Boot 1f2e3d4c --\n"}) {
        const tRecording recording = readTraceOf(fmt::format("{}{}{}", before, line, after));
        ASSERT_EQ(3U, recording.pairs.size());
        EXPECT_TRUE(recording.pairs[1].beginsStretch) << line;
        EXPECT_FALSE(recording.pairs[2].beginsStretch) << line;
        EXPECT_EQ(500'000'001, recording.pairs[2].elapsedNs); // the gap is of unknown length
    }
}

TEST(Trace, readsSummariesAsWhatTheyAre)
{
    const tRecording recording =
        readTraceOf("ptp4l[1.0]: a b c d e rms 3 max 2 freq +1 +/- 3 delay 237 +/- 0\nptp4l[2.0]: "
                    "a b c d e rms 4 max 7 freq +1 +/- 3 delay 237 +/- 0\nptp4l[3.0]: rms 4 mux 9 "
                    "freq +1 +/- 3 delay 237 +/- 0\nptp4l[4.0]: rms -1 max 9 freq\nptp4l[5.0]: rms "
                    "5.1 max 4 freq\nptp4l[6.0]: rms 5 max 4\nptp4l[7.0]: rms 5 max "
                    "1000000000000000000 freq\nptp4l[8.0]: a b c d e f rms 3 max 4 freq\n");
    const tMeasured measured = measure(recording, {});
    EXPECT_EQ(2U, measured.errors.size());
    EXPECT_EQ(kSecondNs, recording.summaries.back().elapsedNs);
    EXPECT_EQ("5: 3 no numbers behind rms and max, 4 no numbers behind rms and max, 5 no numbers "
              "behind rms and max",
              unreadOf(recording));
    EXPECT_NEAR(std::sqrt((9 + 16) / 2.0) * 1e-9, measured.rms(), 1e-18);
    EXPECT_DOUBLE_EQ(7e-9, measured.peak());
    EXPECT_FALSE(measured.mean());
    EXPECT_TRUE(measured.series.phase.empty());
}

TEST(Trace, takesFromOptionsWhatTheFileDoesNotTell)
{
    tReadOptions options;
    options.unitNs = 1;
    for (const char* const text : {"0 5\n1 6\n", "0 ,5\n1 ,6\n", "0,0 5,0\n1,0 6,0\n",
                                   "t,tie (ns)\n0,5\n", "t,offset\n0,5\n", "t,x\n0,5\n"}) {
        const tRecording recording = readTraceOf(text, options);
        EXPECT_EQ(5, recording.pairs.front().errorNs) << text;
        EXPECT_TRUE(recording.notes.empty()) << text;
    }
    const tRecording seconds = readTraceOf("t,x\n0,5\n1,6\n");
    EXPECT_EQ(5e9, seconds.pairs.front().errorNs);
    EXPECT_EQ("columns of time and time error", seconds.format);
    EXPECT_EQ("a column of phase", readTraceOf("Tau: 1\n1\n").format);
    EXPECT_EQ(
        std::vector<std::string>{
            "the column 'x' does not tell its unit, so it is seconds; --unit tells another"},
        seconds.notes);
    EXPECT_EQ(" has a unit of its own; leave --unit out",
              refusalOf("time (s),tie (us)\n0,5\n1,6\n", options));

    options = {};
    options.intervalNs = 2e9;
    const tRecording lines = readTraceOf("phc offset 65 s2 freq -4 delay 3\nphc offset 6x s2 freq "
                                         "-4 delay 3\nphc offset 67 s2 freq -4 delay 3\n",
                                         options);
    ASSERT_EQ(2U, lines.pairs.size());
    EXPECT_EQ(4 * kSecondNs, lines.pairs.back().elapsedNs); // that of the damaged line included
    EXPECT_EQ(" has times of its own; leave --interval out", refusalOf("0 5\n1 6\n", options));
    options.intervalNs = 1.6;
    for (const char* const text : {"1\n2\n", "offset 6 s2 freq -4\noffset 6 s2 freq -4\n"})
        EXPECT_EQ(2, readTraceOf(text, options).pairs.back().elapsedNs) << text;
    options.intervalNs = 2e9;
    options.frequency = true;
    EXPECT_NE("", refusalOf("offset 6 s2 freq -4\n", options));
    const tRecording frequency = readTraceOf("1e-9\n-3e-9\n", options);
    ASSERT_EQ(3U, frequency.pairs.size());
    EXPECT_NEAR(-4, frequency.pairs.back().errorNs, 1e-9);
    EXPECT_EQ("a column of fractional frequency", frequency.format);
}

template <typename Parts> std::string joined(const Parts& parts)
{
    std::string text;
    for (const auto& part : parts)
        text += (text.empty() ? "" : "|") + part;
    return text;
}

TEST(TableRow, isSplitAsPeopleWriteIt)
{
    for (const auto& [line, separator, fields] :
         {std::tuple<const char*, char, const char*>{"a;b,c", ';', "a|b,c"},
          {"a\tb c", '\t', "a|b c"},
          {" 'a' \"b\" ", ' ', "a|b"},
          {"\"x;y\",2", ',', "x;y|2"},
          {"0,125 13,2", ' ', "0,125|13,2"},
          {"0.1, 13.2", ',', "0.1|13.2"},
          {"0 ,5", ',', "0|5"},
          {"1,2 x", ',', "1|2 x"},
          {"1,b c,d", ',', "1|b c|d"},
          {"1,2 x,y", ' ', "1,2|x,y"},
          {"1, 2 3,4", ',', "1|2 3|4"},
          {"1,", ',', "1|"},
          {"'a \"", ' ', "'a|\""},
          {"\"' x '\";''", ';', "x|"}}) {
        EXPECT_EQ(separator, separatorOf(line)) << line;
        EXPECT_EQ(fields, joined(fieldsOf(line, separator)));
    }
    EXPECT_EQ("time [ms]|TIE [us]", joined(titlesOf("# time [ms]  TIE [us]", kBlanks)));
    EXPECT_EQ("t (s)|x", joined(titlesOf("%# t (s) x", kBlanks)));
    EXPECT_EQ("a|b", joined(titlesOf("# a b", kBlanks)));
    for (const char* const title :
         {"TIE (ns)", "tie[ns]", "tie_ns", "TIE/ns", "\"tie ns\"", "tie ( ns"}) {
        EXPECT_EQ("tie", titleOf(title).name) << title;
        EXPECT_EQ("ns", titleOf(title).unit) << title;
    }
    EXPECT_EQ("time_error_x", titleOf("Time error_X").name);
    for (const auto& [ns, units] : {std::pair(1e9, "S sec secs second seconds"),
                                    {1e6, "ms msec milliseconds"},
                                    {1e3, "us usec microseconds \xc2\xb5s \xce\xbcs \xb5s"},
                                    {1.0, "ns nsec nanoseconds"},
                                    {1e-3, "ps psec picoseconds"},
                                    {60e9, "min"},
                                    {3600e9, "h"},
                                    {86'400e9, "d day days"}}) {
        for (const std::string& unit : fieldsOf(units, kBlanks))
            EXPECT_EQ(ns, unitNsOf(unit)) << unit;
    }
}

TEST(TableRow, hasNumbersToTheLastDigit)
{
    EXPECT_EQ(1.5, numberOf("1,5", ';'));
    EXPECT_EQ(1.25, numberOf("1,25", ','));
    EXPECT_EQ(1.234, numberOf("1,234", ';'));
    EXPECT_FALSE(numberOf("1,234", ','));
    EXPECT_FALSE(numberOf("1,234.5", ';'));
    constexpr double kNone = -1;
    const struct {
        const char* field;
        int64_t unitNs;
        uint64_t whole;
        double fraction; // kNone: no number
        // clang-format off
    } kRows[] = {
        {"1,5", kSecondNs, 1'500'000'000, 0}, {"-1.25", 1, static_cast<uint64_t>(-2), 0.75},
        {"-0.5", 1, static_cast<uint64_t>(-1), 0.5}, {".75", 3, 2, 0.25},
        {"18446743000000000001.25", 1, 18'446'743'000'000'000'001U, 0.25},
        {"18446744500000000000", 1, 0, kNone},
        {"9007199254740993", 1000, 9'007'199'254'740'993'000, 0}, {"1e3", 1000, 1'000'000, 0},
        {"-1E-1", 2, static_cast<uint64_t>(-1), 0.8}, {"9e18", 1, 9'000'000'000'000'000'000, 0},
        {"9.1e18", 1, 0, kNone}, {"1e10", kSecondNs, 0, kNone}, {"x", 1, 0, kNone}};
    // clang-format on
    for (const auto& row : kRows) {
        SCOPED_TRACE(row.field);
        const auto ns = exactNsOf(row.field, ';', row.unitNs).value_or(tExactNs{0, kNone});
        EXPECT_EQ(row.whole, ns.whole);
        EXPECT_DOUBLE_EQ(row.fraction, ns.fraction);
    }
}

TEST(Moments, goOnEvenlyThroughALeapSecond)
{
    tMoments moments;
    const auto before = moments.ofDate("2016-12-31", "23:59:59");
    const auto leap = moments.ofDate("2016-12-31", "23:59:60.5");
    const auto after = moments.ofDate("2017-01-01", "00:00:00");
    ASSERT_TRUE(before && leap && after);
    EXPECT_EQ(1'500'000'000, *leap - *before);
    EXPECT_EQ(2'000'000'000, *after - *before);
    EXPECT_EQ(before, moments.ofDate("2016-12-31", "23:59:59"));
    EXPECT_EQ(500'000'000, *moments.ofDate("2016-12-31", "23:59:60.999999999") - *leap + 1);
}

TEST(Moments, areThoseOfTheCalendar)
{
    tMoments moments;
    int64_t days = 0;
    for (int year = 1970; year <= 2261; ++year) {
        const bool isLeapYear = year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
        for (int month = 1; month <= 12; ++month) {
            const int last = month == 2 ? (isLeapYear ? 29 : 28) : 30 + (month + month / 8) % 2;
            for (const int day : {0, 1, 28, last, last + 1}) {
                const std::string date = fmt::format("{}-{:02}-{:02}", year, month, day);
                const auto ns = (days + day - 1) * 86'400 * kSecondNs;
                const bool exists = day > 0 && day <= last;
                EXPECT_EQ(exists ? std::optional(ns) : std::nullopt,
                          moments.ofDate(date, "00:00:00"))
                    << date;
            }
            days += last;
        }
    }
    for (const char* const date : {"2026-13-01", "2026-00-10", "26-01-01", "1969-12-31",
                                   "2262-01-01", "2026x01-01", "2026-01x01", "2026-01-001"})
        EXPECT_FALSE(moments.ofDate(date, "00:00:00")) << date;
    constexpr int64_t kDay = 946'684'800; // 2000-01-01
    EXPECT_EQ((kDay + 86'399) * kSecondNs + 5, moments.ofIso("2000-01-01T23:59:59.000000005"));
    EXPECT_EQ((kDay + 3661) * kSecondNs, moments.ofIso("2000-01-01 01:01:01Z"));
    for (const char* const text : {"2000-01-01x00:00:00", "2000-01-01T00:00:0", "2000-01-01T00:00"})
        EXPECT_FALSE(moments.ofIso(text)) << text;
    EXPECT_EQ(86'401 * kSecondNs + 2, moments.ofJulian("40588", "1.000000002"));
    EXPECT_EQ(86'401 * kSecondNs, moments.ofJulian("40587", "86401"));
    EXPECT_FALSE(moments.ofJulian("40587", "86401.000000001"));
    EXPECT_EQ(int64_t{147'000 - 40'587} * 86'400 * kSecondNs, moments.ofJulian("147000", "0"));
    EXPECT_FALSE(moments.ofJulian("147001", "0"));
    EXPECT_EQ(0, tMoments().ofJulian("40587", "0"));
    EXPECT_FALSE(tMoments().ofJulian("40586", "0"));
    for (const char* const time :
         {"24:00:00", "12:60:00", "12:00:60", "12:00", "23:59:61", "23:58:60", "22:59:60",
          "x2:00:00", "12:x0:00", "12-00:00", "12:00-00", "12:00:005"})
        EXPECT_FALSE(moments.ofDate("2026-02-28", time)) << time;
}

} // namespace
