// Batches of columns: every type both ways against the per-value setters, the refusals (native
// and Java's, which change nothing), readers beside a writer, and references over many batches.
#include <atomic>
#include <climits>
#include <functional>
#include <thread>

#include "TestSupport.h"
#include "VLXKDMColumns.h"

using namespace corvexa_test;

namespace {

using AT = VLXKDMAttributeType;

// One row's values for every attribute of Sample (SampleAttributes): the lists hold the value
// twice, or nothing when the row is "empty".
struct RowValues {
  int integer;
  double real;
  std::string text;
  time_t seconds;
  bool flag;
  std::string bytes;
  int target;
  bool empty;
};
const RowValues kRows[] = {
    {-7, 0.5, std::string("a\0b\xF0\x9F\x98\x80", 7), -1, true, std::string("\0\xFF", 2), 0, false},
    {INT_MIN, -1e300, "", -3155760000, false, "", 1, true},
    {42, 3.25, "\xC3\xA9t\xC3\xA9", 1700000000, true, "xyz", 0, false},
};

VLXBinary Bin(const std::string& s) { return VLXBinary(s.data(), static_cast<int>(s.size())); }

template <class List, class T>
List Twice(const RowValues& v, const T& value)
{
  return v.empty ? List() : ListOf<List>({value, value});
}

// The row's values into the batch (columns 0 to 13 are Sample's attributes in order).
void Stage(VLXKDMColumns& b, long r, const RowValues& v, const std::vector<VLXKDMInstance>& targets)
{
  const VLXKDMInstance& t = targets[v.target];
  const long rcs[] = {
      b.SetInteger(0, r, v.integer),
      b.SetDouble(1, r, v.real),
      b.SetText(2, r, U(v.text)),
      b.SetTime(3, r, Seconds(v.seconds)),
      b.SetBoolean(4, r, v.flag),
      b.SetBinary(5, r, Bin(v.bytes)),
      b.SetInstance(6, r, t),
      b.SetIntegers(7, r, Twice<VLXRawCollint>(v, v.integer)),
      b.SetDoubles(8, r, Twice<VLXRawColldouble>(v, v.real)),
      b.SetTexts(9, r, Twice<VLXListOfVLXUnicodeString>(v, U(v.text))),
      b.SetTimes(10, r, Twice<VLXListValVLXTime>(v, Seconds(v.seconds))),
      b.SetBooleans(11, r, Twice<VLXListValVLXBoolean>(v, VLXBoolean(v.flag))),
      b.SetBinaries(12, r, Twice<VLXListValVLXBinary>(v, Bin(v.bytes))),
      b.SetInstances(13, r, Twice<VLXListValVLXKDMInstance>(v, t)),
  };
  for (long rc : rcs) ASSERT_EQ(VLX_S_OK, rc) << PeekLastError().text;
}

// The same values through the per-value setters.
void Apply(VLXKDMInstance& in, const RowValues& v, const std::vector<VLXKDMInstance>& targets)
{
  const VLXKDMInstance& t = targets[v.target];
  const long rcs[] = {
      in.SetValue(0, v.integer),
      in.SetValue(1, v.real),
      in.SetValue(2, U(v.text)),
      in.SetValue(3, Seconds(v.seconds)),
      in.SetValue(4, VLXBoolean(v.flag)),
      in.SetValue(5, Bin(v.bytes)),
      in.SetValue(6, t),
      in.SetValue(7, Twice<VLXRawCollint>(v, v.integer)),
      in.SetValue(8, Twice<VLXRawColldouble>(v, v.real)),
      in.SetValue(9, Twice<VLXListOfVLXUnicodeString>(v, U(v.text))),
      in.SetValue(10, Twice<VLXListValVLXTime>(v, Seconds(v.seconds))),
      in.SetValue(11, Twice<VLXListValVLXBoolean>(v, VLXBoolean(v.flag))),
      in.SetValue(12, Twice<VLXListValVLXBinary>(v, Bin(v.bytes))),
      in.SetValue(13, Twice<VLXListValVLXKDMInstance>(v, t)),
  };
  for (long rc : rcs) ASSERT_EQ(VLX_S_OK, rc) << PeekLastError().text;
}

VLXKDMColumns& WriteBatch(VLXKDMColumns& b, long rows)
{
  EXPECT_EQ(VLX_S_OK, b.Reset(rows));
  long column = -1;
  for (const AttributeShape& a : SampleAttributes())
    EXPECT_EQ(VLX_S_OK, b.AddColumn(U(a.name), a.type, a.multi, column));
  return b;
}

VLXKDMColumns& ReadBatch(VLXKDMColumns& b)
{
  long column = -1;
  for (const AttributeShape& a : SampleAttributes()) EXPECT_EQ(VLX_S_OK, b.AddColumn(U(a.name), column));
  return b;
}

// Every attribute of a and b holds equal values in Java (or neither has one).
void ExpectSameValues(VLXKDMInstance& a, VLXKDMInstance& b)
{
  for (int p = 0; p < 14; ++p) {
    SCOPED_TRACE(SampleAttributes()[p].name);
    VLXKDMInstanceValue va, vb;
    const long ra = a.GetValue(p, va), rb = b.GetValue(p, vb);
    ASSERT_EQ(ra, rb);
    if (ra >= 0) {
      EXPECT_TRUE(DeepEquals(va.GetHandle(), vb.GetHandle()));
    }
  }
}

// The batch read back holds row r's values through the typed getters.
void ExpectRow(const VLXKDMColumns& b, long r, const RowValues& v, const std::vector<VLXKDMInstance>& targets)
{
  int i = 0;
  double d = 0;
  VLXUnicodeString s;
  VLXTime t;
  long long ms = 0;
  VLXBoolean f = 0;
  VLXBinary bin;
  VLXKDMInstance in;
  VLXRawCollint is;
  VLXRawColldouble ds;
  VLXListOfVLXUnicodeString ss;
  VLXListValVLXTime ts;
  VLXListValVLXBoolean fs;
  VLXListValVLXBinary bs;
  VLXListValVLXKDMInstance ins;
  const long rcs[] = {b.GetInteger(0, r, i),    b.GetDouble(1, r, d),        b.GetText(2, r, s),
                      b.GetTime(3, r, t),       b.GetMilliseconds(3, r, ms), b.GetBoolean(4, r, f),
                      b.GetBinary(5, r, bin),   b.GetInstance(6, r, in),     b.GetIntegers(7, r, is),
                      b.GetDoubles(8, r, ds),   b.GetTexts(9, r, ss),        b.GetTimes(10, r, ts),
                      b.GetBooleans(11, r, fs), b.GetBinaries(12, r, bs),    b.GetInstances(13, r, ins)};
  for (long rc : rcs) ASSERT_EQ(VLX_S_OK, rc) << PeekLastError().text;
  EXPECT_EQ(v.integer, i);
  EXPECT_EQ(v.real, d);
  EXPECT_EQ(v.text, Text(s));
  EXPECT_EQ(v.seconds, t.Gettime_t());
  EXPECT_EQ(v.seconds * 1000LL, ms);
  EXPECT_EQ(v.flag, f != 0);
  EXPECT_TRUE(Bin(v.bytes) == bin);
  EXPECT_TRUE(in == targets[v.target]);
  EXPECT_TRUE(is == Twice<VLXRawCollint>(v, v.integer));
  EXPECT_TRUE(ds == Twice<VLXRawColldouble>(v, v.real));
  EXPECT_EQ(Texts(Twice<VLXListOfVLXUnicodeString>(v, U(v.text))), Texts(ss));
  EXPECT_TRUE(ts == Twice<VLXListValVLXTime>(v, Seconds(v.seconds)));
  EXPECT_TRUE(fs == Twice<VLXListValVLXBoolean>(v, VLXBoolean(v.flag)));
  EXPECT_TRUE(bs == Twice<VLXListValVLXBinary>(v, Bin(v.bytes)));
  EXPECT_TRUE(ins == Twice<VLXListValVLXKDMInstance>(v, targets[v.target]));
}

// Rows 0 to 2 hold kRows (staged out of order, row 0 twice), row 3 no value: created, they hold
// what the per-value setters give; read back, the getters give them again; the read batch written
// to other instances gives them the same values.
TEST(Columns, EveryTypeCrossesBothWays)
{
  SampleReplica s;
  const std::vector<VLXKDMInstance> targets = {s.Create(), s.Create()};
  VLXKDMColumns batch;
  WriteBatch(batch, 4);
  for (long r : {2, 0, 1}) Stage(batch, r, kRows[r == 0 ? 2 : r], targets);
  Stage(batch, 0, kRows[0], targets);
  VLXListValVLXKDMInstance created;
  ASSERT_EQ(VLX_S_OK, batch.CreateInstances(s.model, created)) << PeekLastError().text;
  ASSERT_EQ(4, created.Size());
  for (int r = 0; r < 3; ++r) {
    VLXKDMInstance expected = s.Create();
    Apply(expected, kRows[r], targets);
    ExpectSameValues(created[r + 1], expected);
  }
  VLXKDMInstanceValue none;
  EXPECT_LT(created[4].GetValue(0, none), 0);

  VLXKDMColumns read;
  ASSERT_EQ(VLX_S_OK, ReadBatch(read).GetValues(created)) << PeekLastError().text;
  long rows = 0;
  EXPECT_EQ(VLX_S_OK, read.GetRowCount(rows));
  EXPECT_EQ(4, rows);
  for (int r = 0; r < 3; ++r) ExpectRow(read, r, kRows[r], targets);
  for (int p = 0; p < 14; ++p) {
    VLXBoolean has = 9;
    EXPECT_EQ(VLX_S_OK, read.HasValue(p, 3, has));
    EXPECT_EQ(0, has);
    int type = -1;
    VLXBoolean multi = 9;
    VLXUnicodeString name;
    EXPECT_EQ(VLX_S_OK, read.GetColumn(p, name, type, multi));
    EXPECT_EQ(SampleAttributes()[p].type, type);
    EXPECT_EQ(SampleAttributes()[p].multi, multi != 0);
  }

  VLXListValVLXKDMInstance copies;
  for (int r = 0; r < 4; ++r) copies.Append(s.Create());
  ASSERT_EQ(VLX_S_OK, read.SetValues(copies)) << PeekLastError().text;
  for (int r = 1; r <= 4; ++r) ExpectSameValues(copies[r], created[r]);

  // A model's instances, in set order: the targets, the created, the expected, the copies.
  VLXKDMColumns all;
  long column = -1;
  ASSERT_EQ(VLX_S_OK, all.AddColumn(U("integer"), column));
  ASSERT_EQ(VLX_S_OK, all.GetValues(s.model)) << PeekLastError().text;
  int second = 0;
  EXPECT_EQ(VLX_S_OK, all.GetRowCount(rows));
  EXPECT_EQ(13, rows);
  EXPECT_EQ(VLX_S_OK, all.GetInteger(0, 3, second));
  EXPECT_EQ(kRows[1].integer, second);
  // A list of instances longer than a column's first Java array (16) grows it, keeping the order.
  VLXKDMColumns many;
  VLXListValVLXKDMInstance forty, made;
  for (int k = 0; k < 40; ++k) forty.Append(targets[k % 2]);
  WriteBatch(many, 1);
  ASSERT_EQ(VLX_S_OK, many.SetInstances(13, 0, ListOf<VLXListValVLXKDMInstance>({targets[1]})));
  ASSERT_EQ(VLX_S_OK, many.SetInstances(13, 0, forty));
  ASSERT_EQ(VLX_S_OK, many.CreateInstances(s.model, made));
  VLXListValVLXKDMInstance back;
  ASSERT_EQ(VLX_S_OK, ReadBatch(many).GetValues(made));
  ASSERT_EQ(VLX_S_OK, many.GetInstances(13, 0, back));
  EXPECT_TRUE(back == forty);
  // An empty batch creates nothing and reads nothing.
  VLXKDMColumns empty;
  VLXListValVLXKDMInstance nothing;
  ASSERT_EQ(VLX_S_OK, WriteBatch(empty, 0).CreateInstances(s.model, nothing)) << PeekLastError().text;
  EXPECT_EQ(0, nothing.Size());
  EXPECT_EQ(VLX_S_OK, empty.GetValues(nothing));
  EXPECT_EQ(VLX_S_OK, empty.GetRowCount(rows));
  EXPECT_EQ(0, rows);
  // Milliseconds cross as they are, before 1970 too; as a time they round to the nearest second.
  VLXKDMColumns dates;
  WriteBatch(dates, 1);
  ASSERT_EQ(VLX_S_OK, dates.SetMilliseconds(3, 0, -1500));
  ASSERT_EQ(VLX_S_OK, dates.SetValues(ListOf<VLXListValVLXKDMInstance>({targets[0]})));
  ASSERT_EQ(VLX_S_OK, ReadBatch(dates).GetValues(ListOf<VLXListValVLXKDMInstance>({targets[0]})));
  long long ms = 0;
  VLXTime t;
  EXPECT_EQ(VLX_S_OK, dates.GetMilliseconds(3, 0, ms));
  EXPECT_EQ(VLX_S_OK, dates.GetTime(3, 0, t));
  EXPECT_EQ(-1500, ms);
  EXPECT_EQ(-1, t.Gettime_t());
}

// Each refusal fails with VLX_E_INVALIDARG or the translated Java refusal, its last error naming
// the cause (Java's: the row and attribute), and leaves the replica as it was.
TEST(Columns, RefusalsNameTheCauseAndChangeNothing)
{
  SampleReplica s, other("other");
  VLXKDMInstance live = s.Create(), foreign = other.Create(), unbuilt;
  VLXKDMColumns b;
  WriteBatch(b, 3);
  int value = 0;
  VLXListValVLXKDMInstance out;
  VLXKDMModel noModel;
  VLXKDMColumns empty;
  struct Refusal {
    const char* cause;
    std::function<long()> call;
  };
  const Refusal refusals[] = {
      {"column 1 ('double') holds Double values, not Integer values", [&] { return b.SetInteger(1, 0, 1); }},
      {"the batch has no row 3 (it has 3)", [&] { return b.SetInteger(0, 3, 1); }},
      {"the batch has no column 14 (it has 14)", [&] { return b.SetInteger(14, 0, 1); }},
      {"not valid UTF-8 (truncated sequence)", [&] { return b.SetText(2, 0, U("ok\xC3")); }},
      {"of element 2 of the list is not valid UTF-8",
       [&] {
         return b.SetTexts(9, 0, ListOf<VLXListOfVLXUnicodeString>({U("ok"), U("\xC3")}));
       }},
      {"the text has no bytes or a negative length", [&] { return b.SetText(2, 0, nullptr, 3); }},
      {"the binary has no bytes or a negative length", [&] { return b.SetBinary(5, 0, nullptr, 2); }},
      {"the type 9 is not an attribute type",
       [&] {
         long column = 0;
         return b.AddColumn(U("x"), static_cast<AT::Type>(9), 0, column);
       }},
      {"beyond the range of a Java date", [&] { return b.SetTime(3, 0, Seconds(LLONG_MAX / 100)); }},
      {"row 0 of column 0 ('integer') has no value", [&] { return b.GetInteger(0, 0, value); }},
      {"the list holds 1 instances for the batch's 3 rows",
       [&] { return b.SetValues(ListOf<VLXListValVLXKDMInstance>({live})); }},
      {"a batch has 0 to 2147483647 rows, not -1", [&] { return empty.Reset(-1); }},
      {"the batch has no column to read", [&] { return empty.GetValues(s.model); }},
      {"Columns.create: model is null", [&] { return b.CreateInstances(noModel, out); }},
      {"row 2, attribute 'Sample.instance'",
       [&] {
         b.SetInstance(6, 2, foreign);
         return b.CreateInstances(s.model, out);
       }},
      {"row 1, attribute 'integer': the instance is null",
       [&] {
         return b.SetValues(ListOf<VLXListValVLXKDMInstance>({live, unbuilt, live}));
       }},
  };
  VLXUnicodeString before, after;
  ASSERT_EQ(VLX_S_OK, s.replica.GetXml(0, 1, before));
  for (const Refusal& refusal : refusals) {
    SCOPED_TRACE(refusal.cause);
    ClearLastError();
    EXPECT_LT(refusal.call(), 0);
    EXPECT_TRUE(Has(PeekLastError().text, refusal.cause)) << PeekLastError().text;
  }
  ASSERT_EQ(VLX_S_OK, s.replica.GetXml(0, 1, after));
  EXPECT_EQ(Text(before), Text(after));
  EXPECT_EQ(0, out.Size());
}

// Readers of a model's columns see whole batches only while another thread writes them.
TEST(Columns, ReadersSeeWholeBatchesWhileAnotherThreadWrites)
{
  SampleReplica s;
  constexpr int kBatches = 40, kRowsPerBatch = 250;
  std::atomic<bool> done{false};
  std::atomic<int> torn{0}, reads{0};
  std::thread writer([&] {
    VLXKDMColumns b;
    long column = -1;
    for (int k = 0; k < kBatches; ++k) {
      b.Reset(kRowsPerBatch);
      b.AddColumn(U("integer"), AT::Integer, 0, column);
      for (int r = 0; r < kRowsPerBatch; ++r) b.SetInteger(0, r, k);
      VLXListValVLXKDMInstance made;
      if (b.CreateInstances(s.model, made) < 0) ++torn;
    }
    done = true;
  });
  std::vector<std::thread> readers;
  for (int t = 0; t < 2; ++t)
    readers.emplace_back([&] {
      VLXKDMColumns b;
      long column = -1, rows = 0;
      b.AddColumn(U("integer"), column);
      while (!done) {
        if (b.GetValues(s.model) < 0 || b.GetRowCount(rows) < 0 || rows % kRowsPerBatch != 0) {
          ++torn;
          continue;
        }
        for (long r = 0; r < rows; ++r) {
          int v = -1;
          if (b.GetInteger(0, r, v) < 0 || v != r / kRowsPerBatch) ++torn;
        }
        ++reads;
      }
    });
  writer.join();
  for (std::thread& t : readers) t.join();
  EXPECT_EQ(0, torn.load());
  EXPECT_GT(reads.load(), 0);
}

// A thousand batches written, read and refused leave the global and local reference counts flat.
TEST(Columns, ReferencesStayFlatOverAThousandBatches)
{
  SampleReplica s;
  const std::vector<VLXKDMInstance> targets = {s.Create(), s.Create()};
  VLXKDMColumns write, read;
  ReadBatch(read);
  auto batch = [&] {
    WriteBatch(write, 2);
    Stage(write, 0, kRows[0], targets);
    Stage(write, 1, kRows[1], targets);
    VLXListValVLXKDMInstance made;
    EXPECT_EQ(VLX_S_OK, write.CreateInstances(s.model, made));
    EXPECT_EQ(VLX_S_OK, read.GetValues(made));
    EXPECT_EQ(VLX_S_OK, write.SetValues(made));
    VLXKDMInstance in;
    VLXListValVLXKDMInstance ins;
    EXPECT_EQ(VLX_S_OK, read.GetInstance(6, 0, in));
    EXPECT_EQ(VLX_S_OK, read.GetInstances(13, 0, ins));
    write.SetInteger(0, 0, 1);
    EXPECT_LT(write.SetValues(ListOf<VLXListValVLXKDMInstance>({made[1], VLXKDMInstance()})), 0);
  };
  batch();
  const long globals = GlobalRefCount(), locals = LocalRefCount();
  for (int k = 0; k < 1000; ++k) batch();
  EXPECT_EQ(globals, GlobalRefCount());
  EXPECT_EQ(locals, LocalRefCount());
}

}  // namespace
