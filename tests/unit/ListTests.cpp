#include <gtest/gtest.h>

#include <cstdint>
#include <set>
#include <string>

#include "base/KeyHash.h"
#include "base/KeyedList.h"
#include "fakes/FakePlatform.h"
#include "session/TransferLists.h"

namespace tarnwick {
namespace {

TEST(KeyedHash, IsSipHash13AndCollidesForOneKeyAlone) {
  // An independent implementation's results for the key 0.
  EXPECT_EQ(KeyedHash("abc", {}), 0xc03bc3a0042630f2);
  EXPECT_EQ(KeyedHash("holiday picture 000123.jpg", {}), 0x4c65881e985a52fe);
  std::set<std::uint64_t> places[2];
  for (int i = 0; i < 100'000; ++i) {
    const std::string name = "name" + std::to_string(i);
    if ((KeyedHash(name, {1, 2}) & 1023) != 5) continue;
    places[0].insert(KeyedHash(name, {1, 3}) & 1023);
    places[1].insert(KeyedHash(name, {2, 2}) & 1023);
  }
  // Of the about 98 names.
  EXPECT_GT(places[0].size(), 70U);
  EXPECT_GT(places[1].size(), 70U);
}

// Hosts' texts may be no valid UTF-16.
TEST(FileList, FindsEveryAddress) {
  const Text addresses[] = {u"a",       u"ax",           u"a\u00e9",
                            u"a\u00e8", u"\u00e9\u20ac", u"\xD83D\xDE00",
                            u"\xD83D",  u"\xDE00\xD83D", u"\xFFFD"};
  FileList list;
  for (const Text& address : addresses) {
    const auto record = std::make_shared<CUpload>();
    record->FilePath = address;
    for (const Text& other : addresses) EXPECT_EQ(record->FilePath == other, address == other);
    list.Add(record);
  }
  for (const Text& address : addresses) {
    const CUpload* const found = list.Find(address);
    EXPECT_TRUE(found && Text(found->FilePath) == address) << Utf8FromText(address);
    EXPECT_FALSE(list.Find(address + u"b"));
  }
  EXPECT_FALSE(list.Find(u""));
}

TEST(KeyedList, KeepsOrderAndUniqueKeys) {
  KeyedList<int> list;
  list.Add(1, u"one");
  list.Add(3, u"three");
  list.Insert(2, 2);
  list.Insert(4, 4);
  for (int i = 1; i <= 4; ++i) EXPECT_EQ(list.At(static_cast<std::size_t>(i)), i);
  EXPECT_EQ(list.PositionOf(u"three"), 3U);
  for (const TextView key : {u"Three", u"", u"none"}) EXPECT_EQ(list.PositionOf(key), 0U);

  EXPECT_EQ(ErrorOf([&] { list.Add(5, u"one"); }), error::kDuplicateKey);
  EXPECT_EQ(ErrorOf([&] { list.Insert(1, 5, u"one"); }), error::kDuplicateKey);
  for (const std::size_t position : {std::size_t{0}, std::size_t{6}}) {
    EXPECT_EQ(ErrorOf([&] { list.Insert(position, 5, u"new"); }), error::kSubscriptOutOfRange);
    EXPECT_EQ(ErrorOf([&] { list.Take(position); }), error::kSubscriptOutOfRange);
  }
  EXPECT_EQ(list.Count(), 4U);
}

TEST(KeyedList, FindsKeysAmongMany) {
  // Against a plain list of the keys, while keys come and go in a fixed disorder.
  KeyedList<int> list;
  std::vector<Text> keys;
  std::uint32_t random = 1;
  for (int step = 0; step < 4'000; ++step) {
    random = random * 1664525 + 1013904223;
    const std::size_t at = (random >> 8) % (keys.size() + 1);
    if (at < keys.size() && (step > 2'000 || step % 4 == 0)) {
      list.Take(at + 1);
      keys.erase(keys.begin() + static_cast<std::ptrdiff_t>(at));
    } else {
      keys.insert(keys.begin() + static_cast<std::ptrdiff_t>(at), u"key" + TextFromNumber(step));
      list.Insert(at + 1, step, keys[at]);
      EXPECT_THROW(list.Add(step, keys[at]), RuntimeError);
    }
    ASSERT_EQ(list.Count(), keys.size());
    if (step % 97 != 0) continue;
    for (std::size_t i = 0; i < keys.size(); ++i) ASSERT_EQ(list.PositionOf(keys[i]), i + 1);
    ASSERT_EQ(list.PositionOf(u"key"), 0U);
  }
}

class TransferListsTest : public testing::Test {
 protected:
  static std::shared_ptr<CUpload> Record(TextView name) {
    auto record = std::make_shared<CUpload>();
    record->FileName = name;
    return record;
  }
  static void Fill(FileList& list, std::initializer_list<TextView> names) {
    list.Clear();
    for (const TextView name : names) list.Add(Record(name));
  }

  FakePlatform fake;
  FileList& all = fake.apartment.listing.all;
  FileList& shown = fake.apartment.listing.shown;
};

TEST_F(TransferListsTest, RemovesTheFirstOfEach) {
  Fill(all, {u"x", u" a ", u"a", u"A"});
  Fill(shown, {u"a", u"a"});
  RemoveFromTransferLists(fake.apartment, u"http://h/users/u/ a ");
  EXPECT_EQ(NamesOf(all), "x,a,A,");
  EXPECT_EQ(NamesOf(shown), "a,");
  // Two records looked at, one removed; one removed.
  EXPECT_EQ(fake.pump.yields, 4);
  // A name that only the shown-files list has, or that differs in letter case, stays.
  Fill(shown, {u"only"});
  for (const TextView name : {u"only", u"X", u""}) RemoveFromTransferLists(fake.apartment, name);
  EXPECT_EQ(NamesOf(all) + NamesOf(shown), "x,a,A,only,");
}

TEST_F(TransferListsTest, SurvivesListsThatChangeMeanwhile) {
  // At each possible moment, what goes is the file of the name or nothing, never a neighbour.
  const auto runWith = [&](int moment, const std::function<void()>& change) {
    Fill(all, {u"x", u"y", u"a", u"z"});
    Fill(shown, {u"x", u"a", u"z"});
    fake.pump.yields = 0;
    fake.pump.onYield = [&, moment] {
      if (fake.pump.yields == moment) change();
    };
    RemoveFromTransferLists(fake.apartment, u"a");
  };
  for (int moment = 1; moment <= 5; ++moment) {
    runWith(moment, [&] {
      all.Clear();
      shown.Clear();
    });
    EXPECT_EQ(NamesOf(all) + NamesOf(shown), "") << moment;
    // A file that moves to a place that was passed is not found.
    runWith(moment, [&] { all.Remove(1); });
    EXPECT_EQ(NamesOf(all), moment == 2 ? "y,a,z," : "y,z,") << moment;
    runWith(moment, [&] {
      all.Insert(1, Record(u"new"));
      shown.Insert(1, Record(u"new"));
    });
    for (const char* kept : {"new,", "x,", "z,"})
      EXPECT_TRUE(NamesOf(all).find(kept) != std::string::npos &&
                  NamesOf(shown).find(kept) != std::string::npos)
          << moment;
  }
}

}  // namespace
}  // namespace tarnwick
