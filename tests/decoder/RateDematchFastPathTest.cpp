// The rate dematcher's fast paths against their references: the integer adder against the
// KQuantized one and its mapped scatter against the step-by-step tables, llrCollect and
// deinterleaveData (random transport blocks, rates, redundancy versions, soft values anywhere
// in 32 bits). The table-driven CRC meets the transmitter's bit-serial one in its own tests.
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include "KRateDeMatch.h"

namespace brannoc::test {
namespace {

TEST(RateDematchFastPath, IntegerAdderEqualsTheQuantizedOne) {
  const KQuantized format(0.0, 3, 5, false);
  std::mt19937 rng(2);
  std::uniform_int_distribution<std::int32_t> any(std::numeric_limits<std::int32_t>::min(),
                                                  std::numeric_limits<std::int32_t>::max());
  std::uniform_int_distribution<std::int32_t> near(-300, 300);
  for (int n = 0; n < 100000; ++n) {
    const std::int32_t a = n % 2 == 0 ? near(rng) : any(rng);
    const std::int32_t b = n % 3 == 0 ? any(rng) : near(rng);
    ASSERT_EQ(KRateDeMatch::saturatingAdd(a, b, format.getMinQ(), format.getMaxQ()),
              KRateDeMatch::saturatedSum(format, a, b))
        << a << " + " << b;
  }
}

TEST(RateDematchFastPath, MappedScatterEqualsTheReferenceChain) {
  std::mt19937 rng(7);
  std::uniform_int_distribution<std::uint32_t> tbSize(16, 30000);
  std::uniform_int_distribution<std::int32_t> soft(-200, 200);
  std::uniform_int_distribution<std::int32_t> any(std::numeric_limits<std::int32_t>::min(),
                                                  std::numeric_limits<std::int32_t>::max());
  constexpr std::uint32_t kQm[] = {2, 4, 6};
  KRateDeMatch fast;
  KRateDeMatch reference;
  for (int n = 0; n < 60; ++n) {
    const std::uint32_t tb = tbSize(rng);
    const std::uint32_t Qm = kQm[n % 3];
    // From a tenth to four times the coded bits, a whole number of symbols.
    const std::uint32_t G = Qm * (1 + rng() % ((tb * 12) / Qm + 1));
    const std::uint32_t rv = n % 4;
    for (KRateDeMatch* rdm : {&fast, &reference}) {
      ASSERT_TRUE(rdm->setModulationParams(G, Qm, 1, 0));
      ASSERT_TRUE(rdm->setParams(tb, G, Qm, rv, 1));
    }
    const rateMatchParams& params = fast.getRMParams();
    for (std::uint32_t r = 0; r < params.seg.C; ++r) {
      KRateDeMatch::SoftValues in(fast.getCodeBlockE(r));
      for (std::int32_t& v : in) {
        v = n % 5 == 0 ? any(rng) : soft(rng);
      }
      KRateDeMatch::Streams a;
      KRateDeMatch::Streams b;
      ASSERT_TRUE(fast.rateDematchData(in, a, r));
      ASSERT_TRUE(reference.rateDematchDataReference(in, b, r));
      ASSERT_EQ(a, b) << "TB " << tb << ", G " << G << ", Qm " << Qm << ", rv " << rv << ", block "
                      << r;
    }
  }
}

}  // namespace
}  // namespace brannoc::test
