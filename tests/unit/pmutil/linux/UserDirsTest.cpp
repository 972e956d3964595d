#include "linux/UserDirs.h"

#include <sstream>

#include <gtest/gtest.h>

namespace pmutil {
namespace {

TEST(UserDirsTest, FindsTheDesktop)
{
    const struct {
        const char* text;
        const char* found;
    } kCases[] = {
        {"", ""},
        {"XDG_DESKTOP_DIR=\"$HOME/Schreibtisch\"\n", "/home/u/Schreibtisch"},
        {"XDG_DESKTOP_DIR=\"$HOME/a b\"", "/home/u/a b"},
        {"# comment\nXDG_MUSIC_DIR=\"$HOME/m\"\nXDG_DESKTOP_DIR=\"$HOME/d\"\n", "/home/u/d"},
        {"XDG_DESKTOP_DIR=\"/srv/desk\"\n", "/srv/desk"},
        {" XDG_DESKTOP_DIR\t= \"$HOME/d\"\n", "/home/u/d"},
        {"XDG_DESKTOP_DIR=\"$HOME/\"\n", "/home/u/"},
        {"XDG_DESKTOP_DIR=\"$HOME\"\n", "/home/u"},
        {"XDG_DESKTOP_DIR=\"$HOME/q\\\"q\\\\\"\n", "/home/u/q\"q\\"},
        {"XDG_DESKTOP_DIR=\"$HOME/a\"\nXDG_DESKTOP_DIR=\"$HOME/b\"\n", "/home/u/b"},
        {"XDG_DESKTOP_DIR=\"$HOME/a\"\nXDG_DESKTOP_DIR=\"relative\"\n", "/home/u/a"},
        {"#XDG_DESKTOP_DIR=\"$HOME/a\"\n", ""},
        {"XDG_DESKTOP_DIR=\"relative\"\n", ""},
        {"XDG_DESKTOP_DIR=\"$HOMER/a\"\n", ""},
        {"XDG_DESKTOP_DIR=\"/a\\", "/a\\"},
        {"XDG_DESKTOP_DIR=\"/a", "/a"},
        {"XDG_DESKTOP_DIR=$HOME/a\n", ""},
        {"XDG_DESKTOP_DIR\n", ""},
        {"XDG_DESKTOP_DIR=\"\"\n", ""},
        {"XDG_DESKTOP_DIRS=\"$HOME/a\"\n", ""},
    };
    for (const auto& test : kCases) {
        std::istringstream text(test.text);
        EXPECT_EQ(FindDesktopDir(text, "/home/u"), test.found) << test.text;
    }
}

} // namespace
} // namespace pmutil
