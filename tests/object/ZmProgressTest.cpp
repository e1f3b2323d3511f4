// Nested progress against a display that records every call.
#include "../LogCapture.h"

#include <zmlib/ZmProgressGuiInterface.h>
#include <zmlib/ZmProgressInterface.h>
#include <zmlib/ZmRawData.h>

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

namespace {

class RecordingGui : public ZmProgressGuiInterface {
public:
    void showText(const std::string& text) override { texts.push_back(text); }
    void setMaximum(int maximum) override { maxima.push_back(maximum); }
    void setValue(int value) override { values.push_back(value); }
    void setCompleted(const ZmResult& result) override { completed.push_back(result); }
    void userCancels() { callCancelCallback(); }

    std::vector<std::string> texts;
    std::vector<int> maxima;
    std::vector<int> values;
    std::vector<ZmResult> completed;
};

} // namespace

TEST(ZmProgress, NestedTasksShareOneOverallScale)
{
    ZmProgressInterface p;
    RecordingGui gui;
    p.setProgressGui(&gui);
    p.startWorking(10, "outer");
    p.setProgressValue(3);
    p.startWorking(5, "");
    EXPECT_EQ(gui.maxima.back(), 50);
    EXPECT_EQ(gui.values.back(), 15);
    EXPECT_EQ(gui.texts.back(), "outer"); // inherited
    p.setProgressValue(2);
    EXPECT_EQ(gui.values.back(), 17);
    p.setProgressValue(99); // clamped to the inner maximum
    EXPECT_EQ(gui.values.back(), 20);
    p.stopWorking();
    EXPECT_EQ(gui.maxima.back(), 10);
    EXPECT_EQ(gui.values.back(), 4); // the step after the one that held the sub-task
    p.nextStep();
    EXPECT_EQ(gui.values.back(), 5);
    p.startWorking(0, "ignored");
    EXPECT_EQ(gui.maxima.back(), 10);
    p.stopWorking();
    EXPECT_FALSE(p.isWorking());
    ASSERT_EQ(gui.completed.size(), 1u);
    EXPECT_TRUE(gui.completed[0].ok());
    p.stopWorking(); // nothing open, not working: nothing happens
    EXPECT_EQ(gui.completed.size(), 1u);
    // The next run starts again from zero.
    p.startWorking(4, "again");
    EXPECT_EQ(gui.maxima.back(), 4);
    EXPECT_EQ(gui.values.back(), 0);
    p.nextStep();
    EXPECT_EQ(gui.values.back(), 1);
    p.stopWorking();
}

TEST(ZmProgress, CancelFailAndReattach)
{
    ZmProgressInterface p;
    RecordingGui gui;
    p.setProgressGui(&gui);
    p.startWorking(4, "a");
    p.disableCancel();
    gui.userCancels();
    EXPECT_FALSE(p.isCanceled());
    p.startWorking(3, "b");
    p.stopWorking();
    p.stopWorking();
    EXPECT_TRUE(p.canCancel()); // allowed again after the last stop
    p.startWorking(4, "a");
    p.startWorking(2, "b");
    gui.userCancels();
    EXPECT_TRUE(p.isCanceled());
    EXPECT_FALSE(p.isWorking());
    EXPECT_EQ(gui.completed.back().code(), ZmResult::Interrupted);
    p.startWorking(5, "after"); // canceled stays canceled
    EXPECT_FALSE(p.isWorking());

    ZmProgressInterface q;
    RecordingGui other;
    q.setProgressGui(&gui);
    q.setProgressGui(&other);
    EXPECT_EQ(gui.progressInterface(), nullptr);
    EXPECT_EQ(other.progressInterface(), &q);
    gui.userCancels(); // detached: reaches nobody
    EXPECT_FALSE(q.isCanceled());
    LogCapture log;
    q.startWorking(2, "x");
    q.startWorking(2, "y");
    q.setFailed(ZmResult(ZmResult::ReadFileFailed), "disk gone");
    EXPECT_FALSE(q.isWorking());
    EXPECT_EQ(log.matching("Operation failed: 'disk gone'").size(), 1u);
    EXPECT_EQ(other.completed.back().code(), ZmResult::ReadFileFailed);
    EXPECT_STREQ(other.completed.back().text(), "disk gone");
}

TEST(ZmProgress, ScopeClosesWhatItsBlockOpened)
{
    ZmProgressInterface p;
    p.startWorking(3, "kept");
    auto leaveEarly = [&] {
        ProgressScope scope(&p);
        p.startWorking(2, "one");
        p.startWorking(2, "two");
    };
    leaveEarly();
    EXPECT_TRUE(p.isWorking()); // the task opened before the scope is still open
    try {
        ProgressScope scope(&p);
        p.startWorking(2, "thrown");
        throw std::runtime_error("x");
    } catch (const std::runtime_error&) {
    }
    EXPECT_TRUE(p.isWorking());
    p.stopWorking();
    EXPECT_FALSE(p.isWorking());
    ProgressScope nothing(nullptr);
}

TEST(ZmProgress, DownSamplingStepsPerOutputSliceAndStopsWhenCanceled)
{
    std::vector<short> src(8 * 8 * 8, 7), dst(4 * 4 * 4, -1);
    ZmProgressInterface p;
    RecordingGui gui;
    p.setProgressGui(&gui);
    ZmRawData::downSample3D(dst.data(), ZmTypedPointer(src.data()), 8, 8, 8, 2, 2, 2, &p);
    EXPECT_EQ(gui.maxima.front(), 4);
    EXPECT_EQ(gui.values, (std::vector<int>{0, 1, 2, 3, 4}));
    EXPECT_FALSE(p.isWorking());
    EXPECT_EQ(dst[63], 7);

    // A display that cancels after the first slice: the rest stays as it was.
    class CancelAtOne : public RecordingGui {
    public:
        void setValue(int value) override
        {
            if (value == 1) {
                userCancels();
            }
        }
    } canceling;
    ZmProgressInterface q;
    q.setProgressGui(&canceling);
    std::fill(dst.begin(), dst.end(), short(-1));
    ZmRawData::downSample3D(dst.data(), ZmTypedPointer(src.data()), 8, 8, 8, 2, 2, 2, &q);
    EXPECT_EQ(dst[0], 7);
    EXPECT_EQ(dst[16], -1);
    EXPECT_EQ(canceling.completed.back().code(), ZmResult::Interrupted);
}
