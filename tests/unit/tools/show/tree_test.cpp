#include "show/tree.h"

#include <gtest/gtest.h>

namespace {

using vornovsctl::DrawTree;
using vornovsctl::Printable;
using vornovsctl::Terminal;
using vornovsctl::Tone;
using vornovsctl::TreeNode;

TreeNode Family()
{
    return {{{"root"}},
            {{{{"first"}, {"child", Tone::kName}}, {{{{"grandchild"}}, {}}}},
             {{{"last"}, {"good", Tone::kGood}, {"bad", Tone::kBad}}, {{{{"youngest"}}, {}}}}}};
}

TEST(DrawTree, DrawsWithBoxesWhereTheTerminalHasThem)
{
    EXPECT_EQ(DrawTree(Family(), Terminal{true, false, 0}), "root\n"
                                                            "├─ first child\n"
                                                            "│  └─ grandchild\n"
                                                            "└─ last good bad\n"
                                                            "   └─ youngest\n");
}

TEST(DrawTree, DrawsWithAsciiElsewhere)
{
    EXPECT_EQ(DrawTree(Family(), Terminal{}), "root\n"
                                              "|- first child\n"
                                              "|  `- grandchild\n"
                                              "`- last good bad\n"
                                              "   `- youngest\n");
}

TEST(DrawTree, ColoursOnlyWhereItIsTold)
{
    EXPECT_EQ(DrawTree(Family(), Terminal{false, true, 0}),
              "root\n"
              "|- first \x1b[1mchild\x1b[0m\n"
              "|  `- grandchild\n"
              "`- last \x1b[32mgood\x1b[0m \x1b[31mbad\x1b[0m\n"
              "   `- youngest\n");
}

TEST(DrawTree, ContinuesLongLinesBelow)
{
    const TreeNode tree{
        {{"root"}},
        {{{{"12345678"}, {"abc"}, {"defghij"}, {"too-long-for-any-line"}}, {{{{"child"}}, {}}}},
         {{{"12345678"}, {"ä"}, {"defghij"}}, {}}}};

    EXPECT_EQ(DrawTree(tree, Terminal{true, true, 15}), "root\n"
                                                        "├─ 12345678 abc\n"
                                                        "│  │   defghij\n"
                                                        "│  │   too-long-for-any-line\n"
                                                        "│  └─ child\n"
                                                        "└─ 12345678 ä\n"
                                                        "       defghij\n");
}

TEST(DrawTree, FillsALineToItsEndAndNoFurther)
{
    const TreeNode tree{{{"1234"}, {"67"}}, {}};

    EXPECT_EQ(DrawTree(tree, Terminal{true, false, 7}), "1234 67\n");
    EXPECT_EQ(DrawTree(tree, Terminal{true, false, 6}), "1234\n    67\n");
}

TEST(Printable, KeepsWhatCanBeShown)
{
    EXPECT_EQ(Printable(R"(eth0 a-b\c)", false), R"(eth0 a-b\c)");
    EXPECT_EQ(Printable("\xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80", true),
              "\xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80");
}

TEST(Printable, EscapesWhatCannot)
{
    EXPECT_EQ(Printable("a\nb\x1b[1m\x7f", true), R"(a\x0ab\x1b[1m\x7f)");
    EXPECT_EQ(Printable("\xc3\xa4", false), R"(\xc3\xa4)");
    struct Row {
        const char* what;
        std::string bytes;
        std::string shown;
    };
    const Row rows[] = {
        {"a lone continuation", "\x80", R"(\x80)"},
        {"an overlong form of two", "\xc0\xaf", R"(\xc0\xaf)"},
        {"an overlong form of three", "\xe0\x80\xaf", R"(\xe0\x80\xaf)"},
        {"an overlong form of four", "\xf0\x80\x80\xaf", R"(\xf0\x80\x80\xaf)"},
        {"a surrogate", "\xed\xa0\x80", R"(\xed\xa0\x80)"},
        {"beyond the last character", "\xf4\x90\x80\x80", R"(\xf4\x90\x80\x80)"},
        {"cut off", "\xe2\x82", R"(\xe2\x82)"},
        {"interrupted", "\xe2\x82z", R"(\xe2\x82z)"},
        {"a control character above ASCII", "\xc2\x9b", R"(\xc2\x9b)"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(Printable(row.bytes, true), row.shown) << row.what;
    }
}

} // namespace
