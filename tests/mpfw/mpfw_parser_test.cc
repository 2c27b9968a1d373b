// What a host derived from MpfwParser reads that ovmacro does not.
#include "ovmacro/mpfw/mpfw_parser.h"

#include <gtest/gtest.h>

#include "support/test_support.h"

namespace orvan {
namespace {

// Every name but "missing" resolves, to no file it loaded.
struct Host : MpfwParser {
    using MpfwParser::MpfwParser;
    bool ResolveFile(const basic_xstring& name, basic_xstring&) override { return name != "missing"; }
    void OnImport(MpfwSourceFile* file) override { imported = file ? file->fileName : "null"; }
    std::string imported;
};

// Steps ('s'/'p' string/path setting NAME, 'f' file name, 'i' import, 'h' import path): VALUE|REST or error.
TEST(MpfwParser, ReadingSteps) {
    MpfwSourceFileList files;
    MpfwFrame frame(files);
    Host host(frame);
    frame.varFrame.InsertDollarMacro("D", "sub");
    const std::pair<std::string, std::string> cases[] = {
        {"s$NAME = \"v $(D)\" next", "v $(D)|next"},  // taken as it stands
        {"sNAME = \"v\"", "1:1 Expected '$' when read NAME"},
        {"s$NAMES = \"v\"", "1:2 Expected 'NAME' when read NAMES"},
        {"s$NAME \"v\"", "1:7 Expected = after NAME when read \"v\""},
        {"s$NAME = 'v'", "1:9 Expected quoted string when read 'v'"},
        {"p$NAME = \"\" next", "|next"},
        {"p$NAME = \"a\\\\b\"", "1:9 Forward slashes must be used in \"a\\\\b\""},
        {"p$NAME = \"a/\"", "1:9 Path can't end with a trailing slash : \"a/\""},
        {"f\"$(D)/f\" x", "sub/f|\"$(D)/f\" x"},  // the literal stays current
        {"fx", "1:1 Expected quoted string when read x"},
        {"f\"a\\\\b\"", "1:1 Forward slashes must be used in \"a\\\\b\""},
        {"i@import \"f\" $x", "null|$x"},
        {"i@import \"missing\"", "1:2 Couldn't open file missing"},
        {"h$(D)/x/../y/", "sub/y|$(D)/x/../y/"},
    };
    for (const auto& [stepAndText, expected] : cases) {
        const char step = stepAndText[0];
        const std::string text = stepAndText.substr(1);
        std::string result;
        try {
            host.Init(text);
            basic_xstring value;
            if (step == 's') host.ParseStringSetting("NAME", value);
            if (step == 'p') host.ParsePathSetting("NAME", value);
            if (step == 'f') value = host.ParseFileOrDirName();
            if (step == 'i' && host.ParseImportDirective()) value = host.imported;
            if (step == 'h' && host.HandleImportPath(text, nullptr)) value = frame.importPaths.back();
            result = value + "|" + host.token.text.begin();
        } catch (const LexScannerException& e) {
            result = testing::LineColumn(text, e.GetPosition()) + " " + std::string(e.GetMessage());
        }
        EXPECT_EQ(result, expected) << text;
    }
    const testing::TempDir dir;  // files are read as text, with what the host appends; errors go to stderr
    const MpfwSourceFile* f = host.AddFile(dir.Write("f", "a\r\nb"), "\n@def e = E\ne");
    EXPECT_EQ(f ? f->expandedText : "(failed)", "a\nb\nE");
    ::testing::internal::CaptureStderr();
    EXPECT_EQ(host.AddFile(dir.Write("g", "x\n@fail(\"bad\")"), ""), nullptr);
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "\n" + dir.path().string() + "/g(2) : bad\n");
}

// A host that writes generated code drops the import lines; what remains still maps back to its source.
TEST(MpfwParser, DropsImportLinesOnRequest) {
    const testing::TempDir dir;
    struct DiskHost : Host {
        using Host::Host;
        bool ResolveFile(const basic_xstring& name, basic_xstring& fullPath) override {
            fullPath = folder + "/" + name;
            return true;
        }
        std::string folder;
    };
    dir.Write("a.ovm", "@def A = 1\n");
    const std::pair<bool, std::string> cases[] = {{true, "x\n  @import \"a.ovm\"\n\n1\n"}, {false, "x\n1\n"}};
    for (const auto& [keep, expected] : cases) {
        MpfwSourceFileList files;
        MpfwFrame frame(files);
        DiskHost host(frame);
        host.folder = dir.path().string();
        host.SetKeepImportDirectives(keep);
        const MpfwSourceFile* f = host.AddFileWithText("t", "x\n  @import \"a.ovm\"\n\nA\n");
        ASSERT_NE(f, nullptr);
        EXPECT_EQ(f->expandedText, expected);
        ASSERT_EQ(f->pieces.size(), static_cast<int64>(f->expandedText.size()));
        const MpfwSourceFile* a = files[1];  // the body of A, copied
        const auto one = static_cast<int64>(f->expandedText.find('1'));
        EXPECT_EQ(f->pieces.MapOutputPositionToAddress(one), a->text.data() + a->text.find('1'));
        EXPECT_EQ(f->pieces.MapOutputPositionToAddress(one + 1), f->text.data() + f->text.size() - 1);
    }
}

}  // namespace
}  // namespace orvan
