#include "qgf/qgf_ogl/win/HiddenWindow.h"

#include <future>
#include <gtest/gtest.h>

namespace QGF {
namespace OGL {
namespace {

constexpr char kDevice[] = "\\\\.\\DISPLAY1";
constexpr wchar_t kClass[] = L"QGFHiddenWindow";

// Sends a message from another thread, as a broadcast does, while this thread only waits.
bool IsAnswered(HWND window, UINT message)
{
    constexpr UINT kTimeoutMs = 10'000;
    return std::async(std::launch::async,
                      [&] {
                          DWORD_PTR answer = 0;
                          return SendMessageTimeoutW(window, message, 0, 0, SMTO_NORMAL, kTimeoutMs,
                                                     &answer) != 0;
                      })
        .get();
}

TEST(HiddenWindow, AnswersBroadcastsWhileItsThreadIsBusy)
{
    const HiddenWindow window(kDevice);
    const HWND handle = WindowFromDC(window.dc());
    ASSERT_NE(handle, nullptr);
    EXPECT_TRUE(IsAnswered(handle, WM_SETTINGCHANGE));
    EXPECT_TRUE(IsAnswered(handle, WM_QUERYENDSESSION));
}

TEST(HiddenWindow, IgnoresClose)
{
    const HiddenWindow window(kDevice);
    const HWND handle = WindowFromDC(window.dc());
    EXPECT_TRUE(IsAnswered(handle, WM_CLOSE));
    EXPECT_NE(IsWindow(handle), 0);
    EXPECT_EQ(IsWindowVisible(handle), 0);
}

TEST(HiddenWindow, IsDestroyedWithItsObject)
{
    {
        const HiddenWindow first(kDevice);
        const HiddenWindow second(kDevice);
        EXPECT_NE(first.dc(), second.dc());
        EXPECT_NE(FindWindowW(kClass, nullptr), nullptr);
    }
    EXPECT_EQ(FindWindowW(kClass, nullptr), nullptr);
}

} // namespace
} // namespace OGL
} // namespace QGF
