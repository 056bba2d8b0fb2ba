/** @file Who owns what: calls, clones, marks, attached threads, pieces of memory. Telling under AddressSanitizer. */
#include "host/broker/Scope.h"
#include "tests/support/BrokerFixture.h"

#include <atomic>
#include <cstdlib>
#include <thread>

namespace marlo::test {
namespace {

class Scopes : public testing::Test {
  protected:
    static std::string text(const CMPIString* string) { return CMGetCharPtr(string); }

    CMPIInstance* thing(const std::string& id) {
        CMPIInstance* made = CMNewInstance(mb, CMNewObjectPath(mb, "root/test", "Thing", nullptr), nullptr);
        CMPIArray* array = CMNewArray(mb, 1, CMPI_string, nullptr);
        CMSetArrayElementAt(array, 0, id.c_str(), CMPI_chars);
        CMSetProperty(made, "Id", id.c_str(), CMPI_chars);
        CMSetProperty(made, "List", &array, CMPI_stringA);
        return made;
    }

    static void expectThing(const CMPIInstance* made, const std::string& id) {
        EXPECT_EQ(text(CMGetProperty(made, "Id", nullptr).value.string), id);
        const CMPIArray* array = CMGetProperty(made, "List", nullptr).value.array;
        EXPECT_EQ(text(CMGetArrayElementAt(array, 0, nullptr).value.string), id);
    }

    StaticSchema schema;
    broker::Broker broker{schema};
    const CMPIBroker* mb = broker.handle();
};

TEST_F(Scopes, ReleaseWhatACallCreatedAndKeepItsClones) {
    CMPIInstance* instance = nullptr;
    CMPIString* string = nullptr;
    CMPIObjectPath* path = nullptr;
    CMPIArray* array = nullptr;
    CMPIDateTime* time = nullptr;
    CMPIArgs* args = nullptr;
    CMPIContext* context = nullptr;
    {
        const broker::CallScope scope;
        instance = CMClone(thing("kept"), nullptr);
        string = CMClone(CMNewString(mb, "kept", nullptr), nullptr);
        path = CMClone(CMGetObjectPath(thing("kept"), nullptr), nullptr);
        array = CMClone(CMGetProperty(thing("kept"), "List", nullptr).value.array, nullptr);
        time = CMClone(CMNewDateTimeFromChars(mb, "20200229120000.000000+000", nullptr), nullptr);
        CMPIArgs* owned = CMNewArgs(mb, nullptr);
        CMAddArg(owned, "A", "kept", CMPI_chars);
        args = CMClone(owned, nullptr);
        CMPIContext* ownedContext = broker.newContext();
        CMAddContextEntry(ownedContext, "E", "kept", CMPI_chars);
        context = CMClone(ownedContext, nullptr);
    }
    expectThing(instance, "kept");
    EXPECT_EQ(text(string), "kept");
    EXPECT_EQ(text(CMGetKey(path, "Id", nullptr).value.string), "kept");
    EXPECT_EQ(text(CMGetArrayElementAt(array, 0, nullptr).value.string), "kept");
    EXPECT_EQ(time->ft->getBinaryFormat(time, nullptr), 1'582'977'600'000'000U);
    EXPECT_EQ(text(CMGetArg(args, "A", nullptr).value.string), "kept");
    EXPECT_EQ(text(CMGetContextEntry(context, "E", nullptr).value.string), "kept");
    EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(string).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(path).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(array).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(time).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(args).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(context).rc, CMPI_RC_OK);
}

TEST_F(Scopes, LetWhatACallOwnsBeReleasedAnyNumberOfTimes) {
    const broker::CallScope scope;
    CMPIInstance* instance = thing("x");
    EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_OK);
    expectThing(instance, "x");
}

TEST_F(Scopes, LetWhatACloneHoldsBeReleasedWithoutEndingIt) {
    CMPIInstance* clone = nullptr;
    {
        const broker::CallScope scope;
        clone = CMClone(thing("x"), nullptr);
    }
    EXPECT_EQ(CMRelease(CMGetProperty(clone, "Id", nullptr).value.string).rc, CMPI_RC_OK);
    EXPECT_EQ(CMRelease(CMGetProperty(clone, "List", nullptr).value.array).rc, CMPI_RC_OK);
    expectThing(clone, "x");
    CMRelease(clone);
}

TEST_F(Scopes, LetAClonesPropertyBeSetAfterItsCall) {
    CMPIInstance* clone = nullptr;
    {
        const broker::CallScope scope;
        clone = CMClone(thing("old"), nullptr);
    }
    {
        const broker::CallScope scope;
        CMPIString* string = CMNewString(mb, "new", nullptr);
        CMSetProperty(clone, "Id", &string, CMPI_string);
    }
    EXPECT_EQ(text(CMGetProperty(clone, "Id", nullptr).value.string), "new");
    CMRelease(clone);
}

TEST_F(Scopes, AreSeparateWithinEachOther) {
    const broker::CallScope outer;
    CMPIInstance* instance = thing("outer");
    {
        const broker::CallScope inner;
        CMPIString* string = CMNewString(mb, "inner", nullptr);
        CMSetProperty(instance, "Id", &string, CMPI_string); // copied into the outer call's memory
    }
    EXPECT_EQ(text(CMGetProperty(instance, "Id", nullptr).value.string), "inner");
}

TEST_F(Scopes, GiveAThreadOutsideAnyCallMemoryOfItsOwn) {
    std::thread([this] {
        CMPIInstance* instance = thing("thread");
        expectThing(instance, "thread");
    }).join();
}

TEST_F(Scopes, ReleaseAtAMarkWhatWasCreatedSince) {
    const broker::CallScope scope;
    CMPIInstance* before = thing("before");
    CMPIStatus status{};
    CMPIGcStat* mark = mb->mft->mark(mb, &status);
    ASSERT_NE(mark, nullptr);
    thing("since");
    CMPIGcStat* later = mb->mft->mark(mb, nullptr);
    thing("later");
    EXPECT_EQ(mb->mft->release(mb, mark).rc, CMPI_RC_OK);
    expectThing(before, "before");
    EXPECT_EQ(mb->mft->release(mb, later).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(mb->mft->release(mb, mark).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(mb->mft->release(mb, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
    expectThing(thing("after"), "after");
}

TEST_F(Scopes, KeepMarksOfACallFromTheCallsWithin) {
    const broker::CallScope outer;
    CMPIGcStat* mark = mb->mft->mark(mb, nullptr);
    CMPIInstance* instance = thing("outer");
    {
        const broker::CallScope inner;
        EXPECT_EQ(mb->mft->release(mb, mark).rc, CMPI_RC_ERR_INVALID_PARAMETER);
        expectThing(instance, "outer");
        mb->mft->mark(mb, nullptr); // left open: ends with the call
    }
    EXPECT_EQ(mb->mft->release(mb, mark).rc, CMPI_RC_OK);
}

TEST_F(Scopes, OwnPiecesOfMemoryUntilFreed) {
    const CMPIBrokerMemFT* mft = mb->mft;
    const broker::CallScope scope;
    auto* zeroed = static_cast<unsigned char*>(mft->cmpiCalloc(mb, 4, 2));
    ASSERT_NE(zeroed, nullptr);
    EXPECT_EQ(zeroed[7], 0);
    auto* text = mft->cmpiStrDup(mb, "text");
    EXPECT_STREQ(text, "text");
    text = static_cast<char*>(mft->cmpiRealloc(mb, text, 1024));
    EXPECT_STREQ(text, "text");
    EXPECT_NE(mft->cmpiMalloc(mb, 0), nullptr);
    EXPECT_NE(mft->cmpiRealloc(mb, nullptr, 16), nullptr);
    mft->cmpiFree(mb, text);
    mft->cmpiFree(mb, text); // known no more: left alone
    EXPECT_EQ(mft->cmpiRealloc(mb, text, 16), nullptr);
    int foreign = 0;
    mft->cmpiFree(mb, &foreign);
    mft->cmpiFree(mb, nullptr);
    EXPECT_EQ(mft->cmpiCalloc(mb, ~std::size_t{0}, 2), nullptr);
    EXPECT_EQ(mft->cmpiStrDup(mb, nullptr), nullptr);
    EXPECT_STREQ(mb->xft->resolveFileName("Marlo"), "libMarlo.so");
    EXPECT_EQ(mb->xft->resolveFileName(nullptr), nullptr);
}

TEST_F(Scopes, FreeClonesThroughTheMemoryTable) {
    const CMPIBrokerMemFT* mft = mb->mft;
    const broker::CallScope scope;
    mft->freeInstance(mb, CMClone(thing("x"), nullptr));
    mft->freeObjectPath(mb, CMClone(CMGetObjectPath(thing("x"), nullptr), nullptr));
    mft->freeArgs(mb, CMClone(CMNewArgs(mb, nullptr), nullptr));
    mft->freeString(mb, CMClone(CMNewString(mb, "x", nullptr), nullptr));
    mft->freeArray(mb, CMClone(CMNewArray(mb, 1, CMPI_uint8, nullptr), nullptr));
    mft->freeDateTime(mb, CMClone(CMNewDateTime(mb, nullptr), nullptr));
    mft->freeSelectExp(mb, nullptr);
    mft->freeString(mb, nullptr);
    CMPIString* owned = CMNewString(mb, "owned", nullptr);
    mft->freeString(mb, owned);
    EXPECT_EQ(text(owned), "owned");
}

TEST_F(Scopes, OfAttachedThreadsEndAtDetach) {
    CMPIContext* saved = nullptr;
    {
        const broker::CallScope scope;
        CMPIContext* context = broker.newContext();
        CMAddContextEntry(context, "E", "kept", CMPI_chars);
        saved = CBPrepareAttachThread(mb, context);
    }
    ASSERT_NE(saved, nullptr);
    std::thread([this, saved] {
        // As an alert thread does: a context of its own from the one that was saved in a call long over.
        CMPIContext* own = CBPrepareAttachThread(mb, saved);
        ASSERT_EQ(CBAttachThread(mb, own).rc, CMPI_RC_OK);
        EXPECT_EQ(text(CMGetContextEntry(own, "E", nullptr).value.string), "kept");
        expectThing(thing("attached"), "attached");
        EXPECT_EQ(CBDetachThread(mb, own).rc, CMPI_RC_OK);
    }).join();
    // `saved` was never attached: the broker owns it until the end.
}

TEST_F(Scopes, OfAThreadThatNeverDetachesEndWithTheThread) {
    const broker::CallScope scope;
    CMPIContext* prepared = CBPrepareAttachThread(mb, broker.newContext());
    std::thread([this, prepared] {
        CBAttachThread(mb, prepared);
        thing("left");
    }).join();
}

TEST_F(Scopes, RefuseDetachingWhatIsNotAttachedHere) {
    const broker::CallScope scope;
    CMPIContext* prepared = CBPrepareAttachThread(mb, broker.newContext());
    EXPECT_EQ(CBDetachThread(mb, prepared).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(CBAttachThread(mb, prepared).rc, CMPI_RC_OK);
    std::thread([this, prepared] { EXPECT_EQ(CBDetachThread(mb, prepared).rc, CMPI_RC_ERR_FAILED); }).join();
    EXPECT_EQ(CBDetachThread(mb, prepared).rc, CMPI_RC_OK);
    EXPECT_EQ(CBPrepareAttachThread(mb, nullptr), nullptr);
    EXPECT_EQ(CBAttachThread(mb, nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(CBDetachThread(mb, nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(Scopes, LetAPreparedContextBeReleasedInsteadOfAttached) {
    const broker::CallScope scope;
    CMPIContext* prepared = CBPrepareAttachThread(mb, broker.newContext());
    EXPECT_EQ(CMRelease(prepared).rc, CMPI_RC_OK);
}

TEST_F(Scopes, LetTwoThreadsChangeObjectsOfOneCall) {
    const broker::CallScope scope;
    CMPIInstance* theirs = thing("theirs");
    std::thread other([theirs] {
        for (int i = 0; i < 2000; ++i) {
            CMSetProperty(theirs, ("P" + std::to_string(i)).c_str(), "value", CMPI_chars);
        }
    });
    for (int i = 0; i < 2000; ++i) {
        thing("ours");
    }
    other.join();
    EXPECT_EQ(CMGetPropertyCount(theirs, nullptr), 2002U);
}

TEST_F(Scopes, OfManyThreadsDoNotMeet) {
    std::vector<std::thread> threads;
    std::atomic<int> good{0};
    for (int t = 0; t < 8; ++t) {
        threads.emplace_back([this, t, &good] {
            for (int i = 0; i < 200; ++i) {
                const broker::CallScope scope;
                CMPIInstance* clone = CMClone(thing(std::to_string(t)), nullptr);
                CMPIContext* prepared = CBPrepareAttachThread(mb, broker.newContext());
                CBAttachThread(mb, prepared);
                good += text(CMGetProperty(clone, "Id", nullptr).value.string) == std::to_string(t) ? 1 : 0;
                CBDetachThread(mb, prepared);
                CMRelease(clone);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(good, 1600);
}

/** Destroyed as static objects are: after the thread-local ones of the main thread. */
struct LateCaller {
    LateCaller() = default;

    ~LateCaller() {
        const broker::CallScope scope;
        (void)broker::currentArena().allocate(64);
    }

    LateCaller(const LateCaller&) = delete;
    LateCaller& operator=(const LateCaller&) = delete;
};

[[noreturn]] void endWithALateCaller() {
    static const LateCaller late;
    (void)broker::currentArena().allocate(64);
    std::exit(EXIT_SUCCESS);
}

TEST(ScopesDeathTest, CanBeOpenedByStaticObjectsThatEndWithTheProcess) {
    EXPECT_EXIT(endWithALateCaller(), testing::ExitedWithCode(EXIT_SUCCESS), "");
}

} // namespace
} // namespace marlo::test
