#pragma once

#include <memory>
#include <vector>

#include <gtest/gtest.h>

#include <QTest>

#include "ViewTestSupport.h"
#include "support/SystemTime.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"
#include "views/ZoomSlider.h"

namespace glimmet::test {

/// A clock the tests move by hand, for the double-click and key timing.
struct ManualClock {
    static int64_t now;
    static int64_t Now() { return now; }
    /// Far past any time a view could have read from the real clock.
    static void Reset() { now = system_time() + int64_t(1000000000); }
    static void Advance(int64_t micros) { now += micros; }
};

/// A document window stand-in, a manager, a zoom slider and a container of
/// the given size showing one view per channel.
class ViewFixture {
public:
    explicit ViewFixture(int width = 400, int height = 200)
        : manager(&window), slider(new ZoomSlider(&window, 0, 0, 0)),
          container(std::make_unique<ChannelContainerView>(&manager, slider, &window))
    {
        ManualClock::Reset();
        container->resize(width, height);
    }

    /// Adds the channel to the document; the container makes its view.
    SampleView* Add(Channel* channel)
    {
        manager.AddChannel(std::unique_ptr<Channel>(channel));
        SampleView* view = container->SampleViewAtIndex(manager.IndexOf(channel));
        view->SetClock(&ManualClock::Now);
        return view;
    }

    void Show()
    {
        container->show();
        EXPECT_TRUE(QTest::qWaitForWindowExposed(container.get()));
        DeliverPosted();
    }

    SampleView* View(int index) const { return container->SampleViewAtIndex(index); }

    RecordingWindow window;
    ChannelManager manager;
    ZoomSlider* slider;  // child of the container
    std::unique_ptr<ChannelContainerView> container;
};

}  // namespace glimmet::test
