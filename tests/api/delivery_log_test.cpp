#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "api/delivery_fixture.h"
#include "support/log_file.h"

// What queueing and delivering say in the log: literal texts, a blank behind each value.
namespace ZV {
namespace {

class DeliveryLog : protected Test::LogFile, public Test::Delivery {
  protected:
    using Texts = std::vector<std::string>;

    void QueueFrameWithoutCallback(std::uint32_t flags) {
        ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), nullptr, flags, 0, 0));
    }
    Texts TellExposure() {
        TakeTexts();
        EndExposure();
        return TakeMessages("ExposeDone");
    }
    Texts TellImage() {
        TakeTexts();
        ReceiveImage();
        return TakeMessages("ImageReceived");
    }
};

constexpr const char* EmptyOrAborted =
    "Not calling expose done callback because the queue is empty or abort was called";
constexpr const char* CallIsNull = "Not calling expose done callback because it is null";
constexpr const char* MakingUp =
    "Received a frame but the expose done callback wasn't called.  Calling it now before "
    "returning the frame.";

// ---- Queueing ----

TEST_F(DeliveryLog, AQueuedFrameIsNotTold) {
    TakeTexts();

    QueueFrame(3);

    EXPECT_EQ(Texts{}, TakeTexts());
}

TEST_F(DeliveryLog, AQueuedChangeIsToldWithTheLengthOfTheQueue) {
    QueueFrame(3);
    TakeTexts();

    QueueSettings();
    QueueSettings();

    EXPECT_EQ(
        (Texts{"Queued up settings (array size = 2 )", "Queued up settings (array size = 3 )"}),
        TakeMessages("Zentara_QueueSettings"));
}

TEST_F(DeliveryLog, AChangeThatIsMadeAtOnceIsToldAlsoWhereItFails) {
    Zentara_Settings refused = settings;
    SetSettingsWord(refused, zprmBinning, 5);
    TakeTexts();

    EXPECT_ZERR(zerrNone, Zentara_QueueSettings(handle, &settings, nullptr, 0, 0, 0));
    EXPECT_ZERR(zerrDriverFault, Zentara_QueueSettings(handle, &refused, nullptr, 0, 0, 0));

    EXPECT_EQ(Texts(2, "Queue was empty, so settings change applied immediately"),
              TakeMessages("Zentara_QueueSettings"));
}

// ---- An exposure has ended ----

TEST_F(DeliveryLog, AnExposureTellsThatTheQueueIsEmpty) {
    EXPECT_EQ(Texts{EmptyOrAborted}, TellExposure());
}

TEST_F(DeliveryLog, AnExposureBehindAnAbortIsToldWithTheSameWordsAsAnEmptyQueue) {
    QueueFrame(3);
    GetContext().abortRequested = 1;

    EXPECT_EQ(Texts{EmptyOrAborted}, TellExposure());
}

TEST_F(DeliveryLog, AnExposureTellsThatItsFrameHasHadItsCall) {
    QueueFrame(zcbExposeDone, 9);
    EndExposure();

    EXPECT_EQ(Texts{"Not calling expose done callback  for frame 9  because it's already been "
                    "called for this frame"},
              TellExposure());
}

TEST_F(DeliveryLog, AnExposureTellsThatThereIsNoCallback) {
    QueueFrameWithoutCallback(zcbExposeDone);

    EXPECT_EQ(Texts{CallIsNull}, TellExposure());
}

TEST_F(DeliveryLog, AnExposureTellsTheNumberOfTheFrameThatItCalledFor) {
    QueueFrame(zcbExposeDone, 9);

    EXPECT_EQ(Texts{"Called expose done callback for frame number 9 "}, TellExposure());
}

TEST_F(DeliveryLog, AnExposureThatNobodyAskedForIsNotTold) {
    QueueFrame(zcbFrameDone, 9);

    EXPECT_EQ(Texts{}, TellExposure());
}

// ---- An image has arrived ----

TEST_F(DeliveryLog, AnImageThatNobodyQueuedForIsNotTold) {
    EXPECT_EQ(Texts{}, TellImage());
}

TEST_F(DeliveryLog, AFrameThatIsCalledForIsNotTold) {
    QueueFrame(zcbFrameDone);

    EXPECT_EQ(Texts{}, TellImage());
}

TEST_F(DeliveryLog, AnImageTellsThatItMakesUpForTheExposuresCall) {
    QueueFrame(3);

    EXPECT_EQ(Texts{MakingUp}, TellImage());
    EXPECT_EQ(2u, calls.CountCalls());
}

TEST_F(DeliveryLog, AnImageTellsThatThereIsNoCallback) {
    QueueFrameWithoutCallback(3);

    EXPECT_EQ((Texts{MakingUp, CallIsNull,
                     "Not calling framedone callback because the callback in null"}),
              TellImage());
}

TEST_F(DeliveryLog, AnImageTellsThatTheClientWantsNoCall) {
    QueueFrame(0);

    EXPECT_EQ(Texts{"Not calling framedone callback the user doesn't want framedone callbacks"},
              TellImage());
}

TEST_F(DeliveryLog, AnImageTellsThatAnAbortKeepsItFromCalling) {
    QueueFrame(3);
    GetContext().abortRequested = 1;

    EXPECT_EQ((Texts{MakingUp, "Not calling framedone callback because Zentara_Abort was called"}),
              TellImage());
    EXPECT_EQ(0u, calls.CountCalls());
}

}  // namespace
}  // namespace ZV
