// SPDX-License-Identifier: MIT
// Faults of every kind, stops and plain ends, in the host and in the engine and at each depth of nested
// runs, in random order.
#include "Faults.h"
#include "TortureTest.h"

class FaultMixTest : public TortureTest {
 protected:
  enum Place { kInHost, kInEngine };
  static constexpr unsigned kStop = kFaults.size(), kNothing = kStop + 1;

  // One way for a run to end. A run may nest another first, whose end must not touch it.
  struct Ending {
    unsigned how;  // an index of kFaults, kStop or kNothing
    Place place;
    bool nests;
  };

  Ending AnyEnding() { return {Below(kNothing + 1), OneIn(2) ? kInHost : kInEngine, OneIn(8)}; }

  void End(const Ending& ending, void* engine) {
    ++done[ending.how][ending.place];
    if (ending.how == kStop) Stop(engine);
    if (ending.how < kStop) kFaults[ending.how].second();
  }

  void ExpectEnd(const Ending& ending) {
    const auto outer = std::exchange(current, &ending);
    EXPECT_EQ(ending.how == kNothing ? 1 : -1, Run()) << ending.how << " at place " << ending.place;
    EXPECT_TRUE(host.IsClean());
    current = outer;
  }

  // The script, and the macro function that it calls; the nested run is made in the function.
  void Script() {
    void* const engine = host.Engine();
    const Ending& mine = *current;
    Call(L"f");
    if (mine.place == kInEngine) End(mine, engine);
  }
  void Function() {
    void* const engine = host.Engine();
    const Ending& mine = *current;
    if (mine.nests) {
      const Ending inner = AnyEnding();
      ExpectEnd(inner);
      host.Engine() = engine;  // the nested run on the same record has cleared it
    }
    host.AnswerTexts({"text"});
    if (mine.place == kInHost) End(mine, engine);
  }

  const Ending* current = nullptr;
  int done[kNothing + 1][2] = {};
};

TEST_F(FaultMixTest, EachRunEndsAsItShould) {
  on = {{"call 7", [&] { Function(); }}, {"engine: SetScriptState 2", [&] { Script(); }}};
  const int each = Rounds(10000, 20);
  Resources early = {};  // after a tenth
  int runs = 0;
  // Every ending at every place that often, in random order, and what is nested besides.
  std::vector<Ending> endings;
  for (unsigned how = 0; how <= kNothing; ++how)
    for (Place place : {kInHost, kInEngine})
      for (int i = 0; i < each; ++i) endings.push_back({how, place, OneIn(8)});
  std::shuffle(endings.begin(), endings.end(), random);
  for (const Ending& ending : endings) {
    SCOPED_TRACE("run " + std::to_string(runs));
    ExpectEnd(ending);
    if (++runs % 50 == 0) ExpectRightRun();
    if (runs == static_cast<int>(endings.size()) / 10) early = Used();
    if (HasFailure()) break;
  }
  const Resources late = Used();
  for (unsigned how = 0; how <= kNothing; ++how)
    Figure("%s: %d in the host, %d in the engine",
           how < kStop    ? kFaults[how].first
           : how == kStop ? "stop"
                          : "no fault",
           done[how][kInHost], done[how][kInEngine]);
  Figure("%d runs, %u handles after a tenth and %u at the end, %d bytes left behind by each", runs,
         early.handles, late.handles,
         static_cast<int>(late.kilobytes - early.kilobytes) * 1024 / (runs - runs / 10));
  EXPECT_LE(late.handles, early.handles + kOwnHandles);
}
