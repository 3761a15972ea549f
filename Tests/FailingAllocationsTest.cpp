#include <new>

#include "Support/AudioThreadRules.h"
#include "Support/EveryEffect.h"
#include "Support/Sanitizers.h"
#include "Support/Subjects.h"

using namespace TestSupport;

// Memory that runs out may cost a preparation, never more.
namespace {

constexpr int kBlocks = 32;

std::vector<float> Input() { return Sine<float>(kSubjectFrames, 437.5, kSubjectRate, 0.5, 2); }

// Of the last block.
double Sound(Subject<float>& subject) {
    std::vector<float> block;
    for (int i = 0; i < kBlocks; ++i) subject.Run(block = Input());
    return Energy(block);
}

// An engine of "New" in which memory failed is never touched again, not even to free it.
bool LosesItsEngine(const std::string& name) { return name.starts_with("New") || name == "Pitch Shift"; }

void ExpectToSurvive(const std::string& name, const MakeSubject<float>& make) {
    if (!FailingAllocations::CanFail()) GTEST_SKIP() << "allocations cannot be made to fail here";
    const auto other = make();
    other->Prepare();
    const double expected = Sound(*other);
    for (const bool lasting : {false, true})
        for (int after = 0; after < 300; after += 1 + (WITH_ADDRESS_SANITIZER ? after / 8 : 0)) {
            SCOPED_TRACE(name + (lasting ? ", lasting after " : ", once after ") + std::to_string(after));
            std::unique_ptr<Subject<float>> subject;
            auto block = Input();
            bool reached = false;
            const auto attempt = [&](const auto& call) {
                try {
                    call();
                } catch (const std::bad_alloc&) {
                }
            };
            {
                const FailingAllocations failing(after, lasting, LosesItsEngine(name));
                attempt([&] { subject = make(); });
                if (subject) {
                    attempt([&] { subject->Prepare(); });
                    attempt([&] { subject->Run(block); });
                    attempt([&] { subject->Edit(); });
                    attempt([&] { subject->Run(block); });
                }
                reached = failing.Reached();
            }
            // An effect that is not ready lets sound through.
            const bool effect = dynamic_cast<EffectSubject<float>*>(subject.get());
            ASSERT_TRUE(!effect || Sound(*subject) > 0.0);
            if (!subject) subject = make();
            subject->Restore();
            subject->Prepare();
            const double sound = Sound(*subject);
            ASSERT_GT(sound, 0.5 * expected);
            ASSERT_LT(sound, 2.0 * expected);
            if (!reached) break;
        }
}

}  // namespace

TEST_P(EveryEffect, LosesOnePreparationWhereMemoryRunsOut) {
    ExpectToSurvive(GetParam().name, [] { return std::make_unique<EffectSubject<float>>(Make()); });
}

TEST(FailingMemoryTest, CostsOnePreparationBesideTheEffects) {
    ForSubjectsBesideTheEffects<float>(ExpectToSurvive);
}
