// The binary interface of the built library: layout, virtual tables, and the type information of exceptions.
#include <dlfcn.h>
#include <link.h>

#include <type_traits>

#include "jwt/jwt.h"
#include "tests/unit/clients.h"
#include "tests/unit/fixture.h"

namespace Test {

namespace {

using namespace TAVO;

static_assert(!std::has_virtual_destructor_v<SSO::SSOClient>);
static_assert(std::has_virtual_destructor_v<SSO::AzureSSOClient>);
static_assert(std::has_virtual_destructor_v<SSO::WebSphereSSOClient>);
static_assert(std::has_virtual_destructor_v<SSO::SSOProfile>);
static_assert(!std::is_polymorphic_v<JWT::Jwt>);

static_assert(std::is_base_of_v<SSO::SSOClient, SSO::AzureSSOClient>);
static_assert(std::is_base_of_v<SSO::SSOClient, SSO::WebSphereSSOClient>);
constexpr std::size_t kFirstText = 2 * sizeof(void *);  // after the virtual table and a bool
static_assert(sizeof(SSO::SSOClient) == kFirstText + 9 * sizeof(std::string));
static_assert(sizeof(SSO::AzureSSOClient) == sizeof(SSO::SSOClient) + sizeof(std::string));
static_assert(sizeof(SSO::WebSphereSSOClient) == sizeof(SSO::SSOClient));
static_assert(sizeof(SSO::SSOProfile) == kFirstText + sizeof(std::string) + sizeof(SSO::SSOClient));
static_assert(sizeof(JWT::Jwt) == 3 * sizeof(std::string));

// Sizes do not always reveal a changed alignment.
template <typename... Types>
constexpr bool kAreAlignedAsPointers = ((alignof(Types) == alignof(void *)) && ...);
static_assert(
    kAreAlignedAsPointers<SSO::SSOClient, SSO::AzureSSOClient, SSO::WebSphereSSOClient, SSO::SSOProfile, JWT::Jwt,
                          SSO::sso_exception, SSO::sso_err_resp, SSO::sso_not_implemented, SSO::sso_op_failed,
                          JWT::jwt_exception, JWT::jwt_not_support, JWT::jwt_verify_failed>);

// Programs copy clients. Copies are inline, so the list of exported names does not cover them.
template <typename... Types>
constexpr bool kAreCopied = std::conjunction_v<std::is_copy_constructible<Types>..., std::is_copy_assignable<Types>...>;
static_assert(kAreCopied<SSO::SSOClient, SSO::AzureSSOClient, SSO::WebSphereSSOClient, SSO::SSOProfile, JWT::Jwt>);

/// Whether the exception derives from `Base`, adds no fields, and converts from text only explicitly.
template <typename Exception, typename Base>
constexpr bool kIsCaughtAs =
    std::conjunction_v<std::is_base_of<Base, Exception>, std::is_constructible<Exception, std::string>,
                       std::negation<std::is_convertible<std::string, Exception>>> &&
    (sizeof(Exception) == sizeof(std::runtime_error));
static_assert(kIsCaughtAs<SSO::sso_exception, std::runtime_error>);
static_assert(kIsCaughtAs<SSO::sso_err_resp, SSO::sso_exception>);
static_assert(kIsCaughtAs<SSO::sso_not_implemented, SSO::sso_exception>);
static_assert(kIsCaughtAs<SSO::sso_op_failed, SSO::sso_exception>);
static_assert(kIsCaughtAs<JWT::jwt_exception, std::runtime_error>);
static_assert(kIsCaughtAs<JWT::jwt_not_support, JWT::jwt_exception>);
static_assert(kIsCaughtAs<JWT::jwt_verify_failed, JWT::jwt_exception>);

using Slots = std::vector<std::string>;

/// The exported functions in a class's virtual table, in order.
Slots SlotsOf(const std::string &mangledClass) {
    Slots slots;
    void *table = dlsym(RTLD_DEFAULT, ("_ZTV" + mangledClass).c_str());
    Dl_info info;
    const ElfW(Sym) *symbol = nullptr;
    if (table == nullptr ||
        dladdr1(table, &info, reinterpret_cast<void **>(const_cast<ElfW(Sym) **>(&symbol)), RTLD_DL_SYMENT) == 0 ||
        symbol == nullptr) {
        ADD_FAILURE() << "no virtual table of " << mangledClass;
        return slots;
    }
    void **entries = static_cast<void **>(table);
    for (std::size_t i = 2; i < symbol->st_size / sizeof(void *); ++i) {  // after the offset and the type information
        if (dladdr(entries[i], &info) == 0 || info.dli_saddr != entries[i]) {
            slots.emplace_back("not an exported function");
        } else {
            slots.emplace_back(info.dli_sname);
        }
    }
    return slots;
}

constexpr char kString[] = "NSt7__cxx1112basic_stringIcSt11char_traitsIcESaIcEEE";

std::string Function(const std::string &mangledClass, const std::string &nameAndArguments) {
    return "_Z" + mangledClass.substr(0, mangledClass.size() - 1) + nameAndArguments;
}

const std::string kBase = "N4TAVO3SSO9SSOClientE";

/// The eighteen slots. A client overrides four of them.
Slots Eighteen(const std::string &hooks) {
    const std::string string = kString;
    return {
        Function(kBase, "8isEnableEv"),
        Function(kBase, "11GetClientIDB5cxx11Ev"),
        Function(kBase, "15GetClientSecretB5cxx11Ev"),
        Function(kBase, "14GetRedirectURIB5cxx11Ev"),
        Function(kBase, "8GetTokenB5cxx11Ev"),
        Function(kBase, "15GetAuthEndpointB5cxx11Ev"),
        Function(kBase, "16GetTokenEndpointB5cxx11Ev"),
        Function(kBase, "20GetWellknownEndpointB5cxx11Ev"),
        Function(kBase, "17GetLogoutEndpointB5cxx11Ev"),
        Function(kBase, "14SetRedirectURIE" + string),
        Function(kBase, "7SetCodeE" + string),
        Function(kBase, "20RequestWellknownInfoERN4Json5ValueE"),
        Function(kBase, "20RequestTokenEndpointER" + string + "RKS7_"),
        Function(hooks, "13VerifyIDTokenEv"),
        Function(hooks, "19GetIDTokenReqParamsB5cxx11Ev"),
        Function(hooks, "11GetUserNameER" + string),
        Function(hooks, "20ProcessTokenResponseE" + string),
        Function(kBase, "18OpenIDConnectLoginE" + string + "RS7_"),
    };
}

class Interface : public Library {};

TEST_F(Interface, BaseHasEighteenSlotsAndNoDestructor) { EXPECT_EQ(SlotsOf(kBase), Eighteen(kBase)); }

TEST_F(Interface, ClientsOverrideFourSlotsAndAppendDestructor) {
    for (const std::string client : {"N4TAVO3SSO14AzureSSOClientE", "N4TAVO3SSO18WebSphereSSOClientE"}) {
        Slots expected = Eighteen(client);
        expected.push_back(Function(client, "D1Ev"));
        expected.push_back(Function(client, "D0Ev"));
        Slots found = SlotsOf(client);
        if (found.size() > 18 && found[18] == Function(client, "D2Ev")) {
            found[18] = Function(client, "D1Ev");  // the base-object destructor has the same address
        }
        EXPECT_EQ(found, expected) << client;
    }
}

TEST_F(Interface, ProfileHasOnlyDestructor) {
    Slots found = SlotsOf("N4TAVO3SSO10SSOProfileE");
    ASSERT_EQ(found.size(), 2u);
    EXPECT_EQ(found[1], "_ZN4TAVO3SSO10SSOProfileD0Ev");
}

template <typename Object, typename Field>
std::ptrdiff_t Offset(Object &object, Field &field) {
    return reinterpret_cast<char *>(&field) - reinterpret_cast<char *>(&object);
}

struct BaseFields : SSO::SSOClient {
    std::vector<std::ptrdiff_t> Offsets() {
        return {Offset(*this, enable),         Offset(*this, clientID),          Offset(*this, clientSecret),
                Offset(*this, redirectURI),    Offset(*this, authEndpoint),      Offset(*this, tokenEndpoint),
                Offset(*this, logoutEndpoint), Offset(*this, wellknownEndpoint), Offset(*this, code),
                Offset(*this, token)};
    }
};

TEST_F(Interface, BaseStartsDisabledAndEmpty) {
    SSO::SSOClient client;
    EXPECT_FALSE(client.isEnable());
    EXPECT_EQ(client.GetClientID() + client.GetClientSecret() + client.GetRedirectURI() + client.GetToken() +
                  client.GetAuthEndpoint() + client.GetTokenEndpoint() + client.GetWellknownEndpoint() +
                  client.GetLogoutEndpoint(),
              "");
}

TEST_F(Interface, BaseKeepsOrderOfFields) {
    std::vector<std::ptrdiff_t> offsets = {sizeof(void *)};
    for (std::size_t i = 0; i < 9; ++i) {
        offsets.push_back(static_cast<std::ptrdiff_t>(kFirstText + i * sizeof(std::string)));
    }
    BaseFields fields;
    EXPECT_THAT(fields.Offsets(), testing::ElementsAreArray(offsets));
}

TEST_F(Interface, AzureAppendsTenant) {
    AzureClient client;
    EXPECT_EQ(Offset(client, client.tenantID), static_cast<std::ptrdiff_t>(sizeof(SSO::SSOClient)));
}

TEST_F(Interface, ProfileKeepsOrderOfFields) {
    WriteFile(kProfileFile, R"({"sso_enable": true, "sso_profile": "azure"})");
    SSO::SSOProfile profile;
    char *start = reinterpret_cast<char *>(&profile);
    EXPECT_EQ(*reinterpret_cast<bool *>(start + sizeof(void *)), true);
    EXPECT_EQ(*reinterpret_cast<std::string *>(start + kFirstText), "azure");
    EXPECT_EQ(Offset(profile, *profile.GetSSOClient()), static_cast<std::ptrdiff_t>(kFirstText + sizeof(std::string)));
}

TEST_F(Interface, TokenKeepsOrderOfFields) {
    JWT::Jwt jwt("header.body.signature");
    const auto *parts = reinterpret_cast<std::string *>(&jwt);
    EXPECT_EQ(parts[0], "header");
    EXPECT_EQ(parts[1], "body");
    EXPECT_EQ(parts[2], "signature");
}

TEST_F(Interface, LibraryDefinesTypeInformationOfExceptions) {
    for (const std::type_info *type :
         {&typeid(SSO::sso_exception), &typeid(SSO::sso_err_resp), &typeid(SSO::sso_not_implemented),
          &typeid(SSO::sso_op_failed), &typeid(JWT::jwt_exception), &typeid(JWT::jwt_not_support),
          &typeid(JWT::jwt_verify_failed)}) {
        EXPECT_EQ(dlsym(RTLD_DEFAULT, ("_ZTI" + std::string(type->name())).c_str()), type) << type->name();
    }
}

}  // namespace

}  // namespace Test
