#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <ut/dump.h>
#include <ut/host/reference_host.h>
#include <ut/platform/registry.h>
#include <ut/platform/text.h>
#include <ut/scene.h>
#include <ut/sdk/application.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/objects.h>

#include "support/fault_plan.h"
#include "support/registrations.h"
#include "support/scene_mocks.h"
#include "support/temp_folder.h"

namespace {

using ::testing::_;
using ::testing::Invoke;
using ut::ComPtr;
using ut::test::MockEnumProperties;
using ut::test::MockProperties;

std::wstring Hex(const void* pointer) {
    char text[32];
    std::snprintf(text, sizeof text, "%08llX",
                  static_cast<unsigned long long>(reinterpret_cast<std::uintptr_t>(pointer)));
    return ut::platform::WideFromUtf8(text);
}

// Collects what the dumps send to the debugger.
struct DebuggerOutput {
    DebuggerOutput() {
        previous = ut::SetDumpOutput([this](std::wstring_view more) { text += more; });
    }
    ~DebuggerOutput() { ut::SetDumpOutput(previous); }
    std::wstring Take() { return std::exchange(text, {}); }

    ut::DumpOutput previous;
    std::wstring text;
};

// One property an enumeration hands out; `value` is copied shallowly (the test keeps the data).
struct Entry {
    GUID id;
    ULONG flags;
    const wchar_t* name;
    VARIANT value;
};

VARIANT Value(VARTYPE type, LONGLONG bits = 0) {
    VARIANT value{};
    value.vt = type;
    value.llVal = bits;
    return value;
}
VARIANT Pointer(VARTYPE type, const void* pointer) {
    VARIANT value = Value(type);
    value.byref = const_cast<void*>(pointer);
    return value;
}
VARIANT Real(VARTYPE type, double number) {
    VARIANT value = Value(type);
    type == VT_R4 ? void(value.fltVal = static_cast<float>(number)) : void(value.dblVal = number);
    return value;
}

wchar_t* TaskCopy(const wchar_t* text) {
    std::size_t bytes = (std::wcslen(text) + 1) * sizeof(wchar_t);
    auto* copy = static_cast<wchar_t*>(CoTaskMemAlloc(bytes));
    std::memcpy(copy, text, bytes);
    return copy;
}

// A property container over `entries`, handed out one at a time as the host does.
class Container {
public:
    explicit Container(std::vector<Entry> entries) : entries_(std::move(entries)) {
        ON_CALL(properties, EnumProperties(27, _))
            .WillByDefault(Invoke([this](ULONG, IEnumGWProperties** out) {
                next_ = 0;
                enumeration.AddRef();
                *out = &enumeration;
                return S_OK;
            }));
        ON_CALL(enumeration, Next(1, _, _))
            .WillByDefault(Invoke([this](ULONG, tagGWPROPERTY* entry, ULONG* fetched) {
                if (next_ == entries_.size()) {
                    *fetched = 0;
                    return S_FALSE;
                }
                const Entry& from = entries_[next_++];
                *entry = {from.id, from.flags, TaskCopy(from.name), from.value};
                if (from.value.vt == VT_UNKNOWN && from.value.punkVal)
                    from.value.punkVal->AddRef();
                *fetched = 1;
                return S_OK;
            }));
    }

    ::testing::NiceMock<MockProperties> properties;
    ::testing::NiceMock<MockEnumProperties> enumeration;

private:
    std::vector<Entry> entries_;
    std::size_t next_ = 0;
};

constexpr GUID kId = {0x11111111, 0x2222, 0x3333, {0x44, 0x44, 0x55, 0x55, 0x55, 0x55, 0x55, 0x55}};
const std::wstring kIdText = L"{11111111-2222-3333-4444-555555555555}";

std::wstring Header(const void* container, const wchar_t* label) {
    return L"\nKXDumpPropertyContainer [" + Hex(container) + L"] : " + label + L"\n";
}
std::wstring PropertyLine(const std::wstring& indent, ULONG flags, const wchar_t* paddedName) {
    wchar_t hex[16];
    std::swprintf(hex, 16, L"%08lX", static_cast<unsigned long>(flags));
    return indent + L"   " + kIdText + L" Flags=" + hex + L" : " + paddedName;
}

TEST(DumpPropertyContainer, WritesEachTypeAsItsLine) {
    static const char narrow[] = "abc";
    static const wchar_t wide[] = L"w\u00e9";
    struct Case {
        VARIANT value;
        std::wstring line;
    } cases[] = {
        {Value(VT_I2, 0xFFFF), L": INTEGER2 -1\n"},
        {Value(VT_UI2, 0x8000), L": INTEGER2 -32768\n"}, // sign-extended like the signed form
        {Value(VT_I4, -7), L": INTEGER4 -7\n"},
        {Value(VT_UI4, 0xFFFFFFFE), L": INTEGER4 -2\n"},
        {Value(VT_INT, 42), L": INTEGER4 42\n"},
        {Value(VT_UINT, 43), L": INTEGER4 43\n"},
        {Value(VT_UI1, 200), L": INTEGER1 200\n"},
        {Real(VT_R4, 1.5), L": FLOAT_F  1.500000\n"},
        {Real(VT_R8, -2.25), L": FLOAT_D  -2.250000\n"},
        {Real(VT_R8, 1e20), L": FLOAT_D  1" + std::wstring(20, L'0') + L".000000\n"},
        {Value(VT_BOOL, static_cast<USHORT>(VARIANT_TRUE)), L": BOOL     true\n"},
        {Value(VT_BOOL, 0), L": BOOL     false\n"},
        {Pointer(VT_LPSTR, narrow), L": STRING A [abc]\n"},
        {Pointer(VT_LPSTR, nullptr), L": STRING A [<nil>]\n"},
        {Pointer(VT_LPWSTR, wide), L": STRING W [w\u00e9]\n"},
        {Pointer(VT_LPWSTR, nullptr), L": STRING W [<nil>]\n"},
        {Pointer(VT_UNKNOWN, nullptr), L": IUnknown 00000000\n"},
        {Value(VT_EMPTY), L": No idea what this is...(0)\n"},
        {Value(VT_BSTR), L": No idea what this is...(8)\n"},
        {Value(VT_I8, 5), L": No idea what this is...(20)\n"},
    };
    DebuggerOutput output;
    for (const Case& c : cases) {
        Container container({{kId, 0x1B, L"value", c.value}});
        wchar_t label[] = L"types";
        EXPECT_EQ(KXDumpPropertyContainer(&container.properties, label), S_OK);
        EXPECT_EQ(output.Take(), Header(&container.properties, L"types") +
                                     PropertyLine(L"", 0x1B, L"value               ") + c.line)
            << "type " << c.value.vt;
    }
    // A GUID value is a task-allocated copy that the dump frees with the entry.
    auto* copy = static_cast<GUID*>(CoTaskMemAlloc(sizeof(GUID)));
    *copy = kId;
    Container holder({{kId, 1, L"a name longer than twenty", Pointer(GW_VT_GUID, copy)}});
    wchar_t label[] = L"";
    KXDumpPropertyContainer(&holder.properties, label);
    EXPECT_EQ(output.Take(), Header(&holder.properties, L"") +
                                 PropertyLine(L"", 1, L"a name longer than twenty") + L": GUID     " +
                                 kIdText + L"\n");
}

TEST(DumpPropertyContainer, NestsMemberSetsWithoutTheirHeader) {
    Container innermost({{kId, 3, L"deep", Value(VT_I4, 3)}});
    Container inner({{kId, 2, L"first", Value(VT_I4, 1)},
                     {kId, 2, L"set", Pointer(VT_UNKNOWN, static_cast<IUnknown*>(&innermost.properties))}});
    ::testing::NiceMock<MockEnumProperties> notAContainer; // answers only its own interface
    Container outer({{kId, 1, L"before", Value(VT_I4, 0)},
                     {kId, 1, L"members", Pointer(VT_UNKNOWN, static_cast<IUnknown*>(&inner.properties))},
                     {kId, 1, L"other", Pointer(VT_UNKNOWN, static_cast<IUnknown*>(&notAContainer))},
                     {kId, 1, L"after", Value(VT_I4, 9)}});
    DebuggerOutput output;
    wchar_t label[] = L"outer";
    EXPECT_EQ(KXDumpPropertyContainer(&outer.properties, label), S_OK);
    std::wstring expected =
        Header(&outer.properties, L"outer") + PropertyLine(L"", 1, L"before              ") +
        L": INTEGER4 0\n" + PropertyLine(L"", 1, L"members             ") + L": IUnknown " +
        Hex(&inner.properties) + L"\n" + PropertyLine(L"   ", 2, L"first               ") +
        L": INTEGER4 1\n" + PropertyLine(L"   ", 2, L"set                 ") + L": IUnknown " +
        Hex(&innermost.properties) + L"\n" + PropertyLine(L"      ", 3, L"deep                ") +
        L": INTEGER4 3\n" + PropertyLine(L"", 1, L"other               ") + L": IUnknown " +
        Hex(static_cast<IUnknown*>(&notAContainer)) + L"\n" + PropertyLine(L"", 1, L"after               ") +
        L": INTEGER4 9\n";
    EXPECT_EQ(output.Take(), expected);
    // The depth is back at rest: the next dump has its header again, and every reference went back.
    KXDumpPropertyContainer(&innermost.properties, label);
    EXPECT_EQ(output.Take().rfind(Header(&innermost.properties, L"outer"), 0), 0u);
    for (IUnknown* object : std::initializer_list<IUnknown*>{&outer.properties, &inner.properties,
                                                             &innermost.properties, &notAContainer})
        EXPECT_EQ(ut::test::RefTracker::References(object), 1u); // the test's own
}

TEST(DumpPropertyContainer, EndsQuietlyWhenTheEnumerationFails) {
    struct Case {
        HRESULT enumerate, first;
        ULONG firstFetched;
    } cases[] = {{E_FAIL, S_OK, 1}, {S_OK, E_FAIL, 0}, {S_OK, S_FALSE, 0}};
    DebuggerOutput output;
    for (const Case& c : cases) {
        ::testing::NiceMock<MockProperties> properties;
        ::testing::NiceMock<MockEnumProperties> enumeration;
        ON_CALL(properties, EnumProperties(27, _)).WillByDefault(Invoke([&](ULONG, IEnumGWProperties** out) {
            *out = SUCCEEDED(c.enumerate) ? (enumeration.AddRef(), &enumeration) : nullptr;
            return c.enumerate;
        }));
        ON_CALL(enumeration, Next(1, _, _)).WillByDefault(Invoke([&](ULONG, tagGWPROPERTY*, ULONG* fetched) {
            *fetched = c.firstFetched;
            return c.first;
        }));
        wchar_t label[] = L"x";
        EXPECT_EQ(KXDumpPropertyContainer(&properties, label), S_OK);
        EXPECT_EQ(output.Take(), Header(&properties, L"x"));
        EXPECT_EQ(ut::test::RefTracker::References(&enumeration), 1u);
    }
    wchar_t label[] = L"none";
    EXPECT_EQ(KXDumpPropertyContainer(nullptr, label), S_OK);
    EXPECT_EQ(output.Take(), Header(nullptr, L"none"));
}

// Writes the default value of the class's in-process server key (none when `server` is null).
void RegisterServer(const GUID& clsid, const wchar_t* server) {
    ut::UniqueHKey key;
    std::wstring path = L"CLSID\\" + ut::GuidToString(clsid) + L"\\InprocServer32";
    ASSERT_EQ(ut::sdk::CreateKey(HKEY_CLASSES_ROOT, path.c_str(), key), ERROR_SUCCESS);
    if (server) {
        ASSERT_EQ(ut::sdk::SetText(key.get(), nullptr, server), ERROR_SUCCESS);
    }
}

std::string FileText(std::FILE* file) {
    std::rewind(file);
    std::string text;
    for (int c; (c = std::fgetc(file)) != EOF;)
        text += static_cast<char>(c);
    return text;
}

TEST(MapGuidToName, NamesTheClassByItsServer) {
    ut::test::RegistrationScope scope;
    const GUID registered = ut::test::TestGuid(1), noValue = ut::test::TestGuid(2),
               missing = ut::test::TestGuid(3), tooLong = ut::test::TestGuid(4);
    const std::wstring longPath(130, L'x'); // 131 characters with its end: past the 260 bytes announced
    RegisterServer(registered, L"C:\\Plug-ins\\twist.dll");
    RegisterServer(noValue, nullptr);
    RegisterServer(tooLong, longPath.c_str());
    const std::string kNot = "This GUID is NOT registered Properly, (no Default Value)";
    enum Target { kName, kFile, kDebugger };
    struct Case {
        GUID clsid;
        Target target;
        std::wstring name, debugger;
        std::string file;
    } cases[] = {
        {registered, kName, L"] : C:\\Plug-ins\\twist.dll", L"", ""},
        {registered, kFile, L"", L"", "<C:\\Plug-ins\\twist.dll>"},
        {registered, kDebugger, L"", L"C:\\Plug-ins\\twist.dll\n", ""},
        {noValue, kName, L"]", ut::platform::WideFromUtf8(kNot) + L"\n", ""},
        {noValue, kFile, L"", L"", kNot},
        {noValue, kDebugger, L"", ut::platform::WideFromUtf8(kNot) + L"\n", ""},
        {tooLong, kFile, L"", L"", kNot},
        {missing, kName, L"]", L"", ""},
        {missing, kFile, L"", L"", ""},
    };
    DebuggerOutput output;
    for (const Case& c : cases) {
        std::FILE* file = c.target == kFile ? std::tmpfile() : nullptr;
        CKXString name(L"(unchanged)");
        F3DMapGuidToName(c.clsid, file, c.target == kName ? &name : nullptr);
        std::wstring bracket = L"[CLSID\\" + ut::GuidToString(c.clsid);
        EXPECT_EQ(name.Str(), c.target == kName ? bracket + c.name : L"(unchanged)") << c.target;
        EXPECT_EQ(output.Take(), c.debugger) << c.target;
        if (file) {
            EXPECT_EQ(FileText(file), c.file);
            std::fclose(file);
        }
    }
}

constexpr GUID kTransform = {0xA0000001, 0, 0, {0, 0, 0, 0, 0, 0, 0, 1}};
constexpr GUID kX = {0xA0000002, 0, 0, {0, 0, 0, 0, 0, 0, 0, 2}};
constexpr GUID kY = {0xA0000003, 0, 0, {0, 0, 0, 0, 0, 0, 0, 3}};

ut::host::Settings ArmScene() {
    ut::host::Settings settings;
    ut::host::ObjectDescription arm{.name = L"Arm"};
    arm.properties = {
        {.clsid = kTransform, .name = L"Transform", .parameters = {{kX, L"x", 1.0}, {kY, L"y", 2.0}}}};
    ut::host::ObjectDescription rig{.name = L"Rig", .model = true, .children = {arm}};
    ut::host::ObjectDescription user{.name = L"User", .references = L"Rig"};
    ut::host::ObjectDescription ping{.name = L"Ping", .model = true, .references = L"Pong"};
    ut::host::ObjectDescription pong{.name = L"Pong", .model = true, .references = L"Ping"};
    settings.scene.objects = {rig, user, ping, pong};
    return settings;
}

class DumpActiveData : public ::testing::Test {
protected:
    DumpActiveData() {
        ut::SetDumpLogPath(log_);
        EXPECT_EQ(GWQueryGenericObject(CLSID_GWApplication, IID_IGWApplication, application_.PutVoid()),
                  S_OK);
        application_->SetAllowsDumps(TRUE);
    }
    ~DumpActiveData() override { ut::SetDumpLogPath({}); }

    ComPtr<I3DObject> Object(const wchar_t* name) {
        std::wstring copy = name;
        ComPtr<I3DObject> object;
        EXPECT_EQ(F3DGet3DObjectFromName(copy.data(), object.Put()), S_OK);
        return object;
    }
    std::string Log() const {
        std::string log = ut::test::FileContent(log_);
        std::erase(log, '\r'); // the log is a text file: Windows ends its lines with "\r\n"
        return log;
    }

    ut::host::ReferenceHost host_{ArmScene()};
    ut::test::TempFolder folder_;
    std::wstring log_ = folder_ / L"dump.log";
    ComPtr<IGWApplication> application_;
    DebuggerOutput output_;
};

std::wstring Line(int depth, int kindAndSize, const GUID& id, const std::wstring& value) {
    char head[32];
    std::snprintf(head, sizeof head, "%03d %04X: ", depth, kindAndSize);
    return std::wstring(3 * depth, L' ') + ut::platform::WideFromUtf8(head) + ut::GuidToString(id) + value;
}

TEST_F(DumpActiveData, WritesTheHierarchyToTheLogAndTheDebugger) {
    ComPtr<I3DObject> arm = Object(L"Arm"), user = Object(L"User"), ping = Object(L"Ping"),
                      pong = Object(L"Pong");
    const std::wstring empty = L": VT_EMPTY\n", more = L"<more...>\n", end = L"KXDumpActiveData end\n";
    const std::wstring armTree = Line(0, 0x0104, GUID_NULL, empty) + Line(1, 0x0204, kTransform, empty) +
                                 Line(2, 0x0308, kX, empty) + Line(2, 0x0308, kY, empty);
    auto nested = [](const ComPtr<I3DObject>& object) {
        ComPtr<IGWComponentHierarchy> hierarchy;
        EXPECT_EQ(object->QueryInterface(IID_IGWComponentHierarchy, hierarchy.PutVoid()), S_OK);
        tagGWComponent root{};
        hierarchy->GetRootComponent(&root);
        ComPtr<IGWComponentHierarchy> inner;
        hierarchy->GetNestedHierarchy(root, IID_IGWComponentHierarchy, inner.PutVoid());
        return L": IUnknown " + Hex(inner.Get()) + L"\n";
    };
    double time = 1.5;
    struct Case {
        I3DObject* object;
        const wchar_t* label;
        int level;
        double* time;
        std::wstring body;
    } cases[] = {
        {arm.Get(), L"arm", -1, &time, armTree},
        {arm.Get(), nullptr, 2, nullptr, armTree},
        {arm.Get(), L"one level", 1, nullptr,
         Line(0, 0x0104, GUID_NULL, empty) + Line(1, 0x0204, kTransform, empty) + L"      " + more},
        {arm.Get(), L"root only", 0, nullptr, Line(0, 0x0104, GUID_NULL, empty) + L"   " + more},
        // A referenced model's hierarchy is written inside the referencing object's, once per path.
        {user.Get(), L"user", -1, nullptr,
         Line(0, 0x0104, GUID_NULL, nested(user)) + Line(1, 0x0104, GUID_NULL, empty)},
        // Two models that reference each other: the walk stops where it would go round again.
        {ping.Get(), L"cycle", -1, nullptr,
         Line(0, 0x0104, GUID_NULL, nested(ping)) + Line(1, 0x0104, GUID_NULL, nested(pong)) + L"      " +
             more},
        {nullptr, L"nothing", -1, nullptr, L""},
    };
    std::string logged;
    for (const Case& c : cases) {
        std::wstring label = c.label ? c.label : L"";
        KXDumpActiveData(c.object, c.label ? label.data() : nullptr, c.level, c.time);
        std::wstring header = L"\n\nKXDumpActiveData [" + Hex(c.object) + L"]" +
                              (c.time ? std::wstring(L" : TIME:    1.500") : L"") +
                              (c.label ? L" : " + label + L"\n" : L"") + L"\n";
        std::wstring written = output_.Take();
        EXPECT_EQ(written, header + c.body + end) << label;
        logged += ut::platform::Utf8FromWide(written);
        EXPECT_EQ(Log(), logged) << label; // appended, line by line, as sent to the debugger
    }
}

TEST_F(DumpActiveData, WritesNothingUnlessTheApplicationAllowsIt) {
    application_->SetAllowsDumps(FALSE);
    wchar_t label[] = L"off";
    EXPECT_EQ(KXDumpActiveData(Object(L"Arm").Get(), label, -1, nullptr), S_OK);
    EXPECT_EQ(output_.Take(), L"");
    EXPECT_FALSE(std::filesystem::exists(std::filesystem::path(log_)));
}

// Every host call failed in turn: the dump still answers S_OK and either writes nothing (the
// mode test failed) or a header, what it could read, and its end line.
TEST_F(DumpActiveData, SurvivesEveryHostFault) {
    ComPtr<I3DObject> user = Object(L"User");
    int paths = 0;
    ut::test::WalkHostFaults([&] { return KXDumpActiveData(user.Get(), nullptr, -1, nullptr); },
                             [&](int row, long result) {
                                 EXPECT_EQ(result, S_OK) << row;
                                 std::wstring written = output_.Take();
                                 paths += row ? 1 : 0;
                                 if (written.empty())
                                     return;
                                 EXPECT_EQ(written.rfind(L"\n\nKXDumpActiveData [", 0), 0u) << row;
                                 EXPECT_TRUE(written.ends_with(L"KXDumpActiveData end\n")) << row;
                             });
    EXPECT_GE(paths, 6); // the mode test, the root, the nested hierarchy and the walk of each
    std::printf("[ walked ] %d failure paths of KXDumpActiveData\n", paths);
}

} // namespace
