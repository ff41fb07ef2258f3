#include "config/RegistryFileFormat.h"

#include <gtest/gtest.h>

#include "config/TextEncoding.h"

namespace tav {
namespace {

const std::string kShared = "Software\\Tessavar\\Shared";

RegistryDocument Load(std::string_view bytes, std::vector<std::string>* problems = nullptr) {
  RegistryFile file = ParseRegistryFile(bytes);
  if (problems) *problems = file.problems;
  RegistryDocument document;
  ApplyRegistryFile(file, document, true);
  return document;
}

RegistryValue Query(const RegistryDocument& document, const std::string& key,
                    const std::string& name) {
  RegistryValue value;
  EXPECT_EQ(document.QueryValue(key, name, value), kRegistryOk) << key << " " << name;
  return value;
}

// A file as the program writes it: every form of value once.
const char* const kCanonical =
    "Windows Registry Editor Version 5.00\n"
    "\n"
    "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n"
    "\"UserDataPath\"=\"C:\\\\Shows\\\\\"\n"
    "@=\"default\"\n"
    "\n"
    "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\VideoPreferences]\n"
    "\"MonitorX\"=dword:fffff880\n"
    "\"Say \\\"hi\\\"\"=\"a \\\"quoted\\\" word\"\n"
    "\"Blob\"=hex:00,01,fe,ff\n"
    "\"Empty\"=hex:\n"
    "\"Path\"=hex(2):25,00,41,00,25,00,00,00\n"
    "\"Big\"=hex(b):01,00,00,00,00,00,00,00\n"
    "\n";

TEST(RegistryFileFormat, CanonicalFileReadsAndWritesBackUnchanged) {
  std::vector<std::string> problems;
  RegistryDocument document = Load(kCanonical, &problems);
  EXPECT_TRUE(problems.empty());
  const std::string video = kShared + "\\VideoPreferences";
  EXPECT_EQ(Query(document, kShared, "UserDataPath"), RegistryValue::String("C:\\Shows\\"));
  EXPECT_EQ(Query(document, kShared, ""), RegistryValue::String("default"));
  EXPECT_EQ(Query(document, video, "MonitorX"), RegistryValue::Dword(0xfffff880));
  EXPECT_EQ(Query(document, video, "Say \"hi\""), RegistryValue::String("a \"quoted\" word"));
  EXPECT_EQ(Query(document, video, "Blob"),
            RegistryValue::Binary(std::string("\x00\x01\xfe\xff", 4)));
  EXPECT_EQ(Query(document, video, "Empty"), RegistryValue::Binary(""));
  EXPECT_EQ(Query(document, video, "Path"), (RegistryValue{kRegExpandSz, "%A%"}));
  EXPECT_EQ(Query(document, video, "Big"),
            (RegistryValue{kRegQword, std::string("\x01\0\0\0\0\0\0\0", 8)}));
  EXPECT_EQ(FormatRegistryFile(document), kCanonical);
}

TEST(RegistryFileFormat, UnknownContentSurvivesChanges) {
  const std::string original =
      "Windows Registry Editor Version 5.00\n"
      "; exported for the show computer\n"
      "\n"
      "[HKEY_LOCAL_MACHINE\\Software\\Other]\n"
      "\"Kept\"=\"yes\"\n"
      "\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n"
      "; a note by hand\n"
      "\"Multi\"=hex(7):61,00,00,00,62,00,00,00,00,00\n"
      "\"Odd\"=hex(1234):aa\n"
      "\"A\"=dword:00000001\n"
      "\n";
  RegistryDocument document = Load(original);
  ASSERT_EQ(document.SetValue(kShared, "A", RegistryValue::Dword(2)), kRegistryOk);
  ASSERT_EQ(document.CreateKey(kShared + "\\New"), kRegistryOk);
  ASSERT_EQ(document.SetValue(kShared + "\\New", "B", RegistryValue::String("b")), kRegistryOk);
  std::string expected = original;
  expected.replace(expected.find("dword:00000001"), 14, "dword:00000002");
  expected += "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\New]\n\"B\"=\"b\"\n\n";
  EXPECT_EQ(FormatRegistryFile(document), expected);
  EXPECT_EQ(Query(document, kShared, "Multi"),
            (RegistryValue{kRegMultiSz, std::string("a\0b", 3)}));
}

TEST(RegistryFileFormat, UnreadableLinesAreReportedSkippedAndKept) {
  const std::string text =
      "Windows Registry Editor Version 5.00\n"
      "\"Orphan\"=dword:00000001\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n"
      "\"Before\"=dword:00000001\n"
      "\"Broken\"=dword:xyz\n"
      "\"Unclosed\"=\"text\n"
      "garbage line\n"
      "\"NoEquals\" \"x\"\n"
      "\"BadHex\"=hex:1,2g,3\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\n"
      "\"After\"=\"still read\"\n";
  std::vector<std::string> problems;
  RegistryDocument document = Load(text, &problems);
  EXPECT_EQ(problems,
            (std::vector<std::string>{
                "line 2: value outside any key: \"Orphan\"=dword:00000001",
                "line 5: unreadable dword: \"Broken\"=dword:xyz",
                "line 6: unreadable string: \"Unclosed\"=\"text",
                "line 7: not a key or value line: garbage line",
                "line 8: missing \"=\": \"NoEquals\" \"x\"",
                "line 9: unreadable hex data: \"BadHex\"=hex:1,2g,3",
                "line 10: unreadable key line: [HKEY_CURRENT_USER\\Software\\Tessavar\\Shared",
            }));
  EXPECT_EQ(Query(document, kShared, "Before"), RegistryValue::Dword(1));
  EXPECT_EQ(Query(document, kShared, "After"), RegistryValue::String("still read"));
  RegistryValue ignored;
  EXPECT_EQ(document.QueryValue(kShared, "Broken", ignored), kRegistryNotFound);
  // Written back, the unreadable lines stay where they were for a person to fix.
  std::string written = FormatRegistryFile(document);
  EXPECT_NE(written.find("\"Broken\"=dword:xyz\n\"Unclosed\"=\"text\ngarbage line\n"),
            std::string::npos);
  EXPECT_NE(written.find("\"Orphan\"=dword:00000001"), std::string::npos);
  // Reading the written file reports the same lines and nothing new.
  std::vector<std::string> again;
  EXPECT_EQ(Load(written, &again), document);
  EXPECT_EQ(again.size(), problems.size());
}

TEST(RegistryFileFormat, WindowsUtf16ExportImports) {
  std::string text =
      "Windows Registry Editor Version 5.00\r\n\r\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Visualizer]\r\n"
      "\"RemoteHost\"=\"Bühne-Ω-🎄\"\r\n"
      "\"RemotePort\"=dword:0000765f\r\n"
      "\"Folder\"=hex(2):25,00,55,00,53,00,45,00,52,00,50,00,52,00,4f,00,46,00,49,00,4c,\\\r\n"
      "  00,45,00,25,00,5c,00,fc,00,00,00\r\n\r\n";
  std::string bytes = "\xFF\xFE" + Utf8ToUtf16Le(text);
  std::vector<std::string> problems;
  RegistryDocument document = Load(bytes, &problems);
  EXPECT_TRUE(problems.empty()) << problems.front();
  const std::string visualizer = kShared + "\\Visualizer";
  EXPECT_EQ(Query(document, visualizer, "RemoteHost"), RegistryValue::String("Bühne-Ω-🎄"));
  EXPECT_EQ(Query(document, visualizer, "RemotePort"), RegistryValue::Dword(30303));
  EXPECT_EQ(Query(document, visualizer, "Folder"),
            (RegistryValue{kRegExpandSz, "%USERPROFILE%\\ü"}));
  // Exported for Windows again, it is the same file in the same encoding.
  EXPECT_EQ(FormatRegistryFile(document, RegistryFileEncoding::Utf16WithMark), bytes);
}

TEST(RegistryFileFormat, Regedit4EightBitFileImports) {
  const std::string bytes =
      "REGEDIT4\r\n\r\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\r\n"
      "\"Show\"=\"Caf\xe9 \x80 5\"\r\n"
      "\"Expand\"=hex(2):25,41,25,e9,00\r\n";
  std::vector<std::string> problems;
  RegistryDocument document = Load(bytes, &problems);
  EXPECT_TRUE(problems.empty());
  EXPECT_EQ(Query(document, kShared, "Show"), RegistryValue::String("Café € 5"));
  EXPECT_EQ(Query(document, kShared, "Expand"), (RegistryValue{kRegExpandSz, "%A%é"}));
}

TEST(RegistryFileFormat, LongBinaryWrapsAndReadsBack) {
  RegistryDocument document;
  document.CreateKey(kShared);
  std::string blob;
  for (int i = 0; i < 100; ++i) blob += static_cast<char>(i * 7);
  document.SetValue(kShared, "LongBinaryValueName", RegistryValue::Binary(blob));
  document.SetValue(kShared, "Lines", RegistryValue::String("one\r\ntwo"));
  std::string written = FormatRegistryFile(document);
  size_t longest = 0, start = 0;
  for (size_t end; (end = written.find('\n', start)) != std::string::npos; start = end + 1) {
    longest = std::max(longest, end - start);
  }
  EXPECT_LE(longest, 80u);
  EXPECT_NE(written.find("\"Lines\"=hex(1):"), std::string::npos);
  std::vector<std::string> problems;
  EXPECT_EQ(Load(written, &problems), document);
  EXPECT_TRUE(problems.empty());
}

TEST(RegistryFileFormat, DeletionFormsApplyInOrder) {
  RegistryDocument document = Load(
      "Windows Registry Editor Version 5.00\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Old\\Deep]\n\"X\"=\"1\"\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n\"Gone\"=\"1\"\n\"Stays\"=\"1\"\n"
      "[-HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Old]\n"
      "\"Ignored\"=\"value under a deleted key\"\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n\"Gone\"=-\n");
  std::vector<NamedRegistryValue> values;
  ASSERT_EQ(document.EnumValues(kShared, values), kRegistryOk);
  ASSERT_EQ(values.size(), 1u);
  EXPECT_EQ(values[0].first, "Stays");
  EXPECT_EQ(document.OpenKey(kShared + "\\Old"), kRegistryNotFound);
}

TEST(RegistryFileFormat, HeaderIsRequiredButItsAbsenceLosesNothing) {
  std::vector<std::string> problems;
  RegistryDocument document =
      Load("[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]\n\"A\"=\"1\"\n", &problems);
  EXPECT_EQ(problems, std::vector<std::string>{"line 1: no registry editor header: "
                                               "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared]"});
  EXPECT_EQ(Query(document, kShared, "A"), RegistryValue::String("1"));
  Load("", &problems);
  EXPECT_EQ(problems.size(), 1u);
}

TEST(RegistryDocument, KeysAreCaseInsensitiveWithImplicitParents) {
  RegistryDocument document = Load(
      "Windows Registry Editor Version 5.00\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Net\\Universe1]\n\"A\"=\"1\"\n"
      "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Net\\Universe2]\n");
  EXPECT_EQ(document.OpenKey("software\\TESSAVAR\\shared\\net"), kRegistryOk);
  EXPECT_EQ(document.OpenKey(""), kRegistryOk);
  std::vector<std::string> names;
  ASSERT_EQ(document.EnumSubKeys("Software\\Tessavar\\Shared\\NET", names), kRegistryOk);
  EXPECT_EQ(names, (std::vector<std::string>{"Universe1", "Universe2"}));
  EXPECT_EQ(document.DeleteKey(kShared + "\\Net"), kRegistryAccessDenied);
  EXPECT_EQ(document.DeleteKey(kShared + "\\Net\\Universe1"), kRegistryOk);
  EXPECT_EQ(document.DeleteKey(kShared + "\\Net\\Universe2"), kRegistryOk);
  // The parent outlives its last child even though it had no section.
  EXPECT_EQ(document.OpenKey(kShared + "\\Net"), kRegistryOk);
  EXPECT_EQ(document.SetValue(kShared + "\\Missing", "A", RegistryValue::Dword(1)),
            kRegistryNotFound);
  EXPECT_EQ(document.DeleteValue(kShared, "Missing"), kRegistryNotFound);
}

TEST(TextEncoding, ConversionsRoundTripAndReplaceDamage) {
  const std::string text = "aé€🎄";
  EXPECT_EQ(Utf16LeToUtf8(Utf8ToUtf16Le(text)), text);
  EXPECT_TRUE(IsValidUtf8(text));
  EXPECT_FALSE(IsValidUtf8("\xC3"));
  EXPECT_FALSE(IsValidUtf8("\xED\xA0\x80"));  // a surrogate written as UTF-8
  EXPECT_FALSE(IsValidUtf8("\xC0\xAF"));      // overlong
  EXPECT_EQ(Utf16LeToUtf8(std::string("\x00\xD8\x41\x00", 4)),
            "\xEF\xBF\xBD"
            "A");
  EXPECT_EQ(Utf16LeToUtf8(std::string("A\0B", 3)), "A\xEF\xBF\xBD");
  EXPECT_EQ(Cp1252ToUtf8("\x81\x9c\xff"),
            "\xEF\xBF\xBD"
            "œÿ");
}

}  // namespace
}  // namespace tav
