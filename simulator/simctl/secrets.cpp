// SPDX-License-Identifier: LGPL-2.1-or-later
#include "secrets.h"

#include "contracts.h"
#include "glibpointers.h"

#include <QtCore/QFile>
#include <QtCore/QRegularExpression>

namespace Corvane
{
namespace Simulator
{

namespace
{

constexpr char secretAnnotation[] = "org.corvaneos.Secret";

bool isSecretName(const gchar *name)
{
    static const QRegularExpression secret(QStringLiteral("passw|passphrase|passcode|secret|token"),
                                           QRegularExpression::CaseInsensitiveOption);
    return secret.match(QString::fromUtf8(name)).hasMatch();
}

Variant mask()
{
    return Variant(g_variant_new_string("***"));
}

GDBusMethodInfo *methodOf(const JournalCall &call)
{
    const QString interface = QString::fromStdString(call.interface);
    // Others, such as the ones that every bus has, are not built in.
    if (!QFile::exists(QStringLiteral(":/dbus/%1.xml").arg(interface)))
        return nullptr;
    return g_dbus_interface_info_lookup_method(contractOf(interface), call.member.c_str());
}

bool isSecret(const GDBusArgInfo *argument)
{
    return g_dbus_annotation_info_lookup(argument->annotations, secretAnnotation) != nullptr;
}

bool hasSecret(const GDBusMethodInfo *method)
{
    for (GDBusArgInfo **argument = method->in_args; argument && *argument; ++argument) {
        if (isSecret(*argument))
            return true;
    }
    return false;
}

std::string signatureOf(const GDBusMethodInfo *method)
{
    std::string signature;
    for (GDBusArgInfo **argument = method->in_args; argument && *argument; ++argument)
        signature += (*argument)->signature;
    return signature;
}

/** @p value, with what is named as a secret masked. */
Variant withNamedSecretsMasked(GVariant *value);

/** The same for @p value behind the @p name of something. */
Variant maskedBehind(const Variant &name, GVariant *value)
{
    const bool isName = name && g_variant_is_of_type(name.get(), G_VARIANT_TYPE_STRING);
    if (!isName || !isSecretName(g_variant_get_string(name.get(), nullptr)))
        return withNamedSecretsMasked(value);
    return g_variant_is_of_type(value, G_VARIANT_TYPE_VARIANT) ? Variant(g_variant_new_variant(mask().get()))
                                                               : mask();
}

Variant withNamedSecretsMasked(GVariant *value)
{
    if (g_variant_is_of_type(value, G_VARIANT_TYPE_VARIANT))
        return Variant(
            g_variant_new_variant(withNamedSecretsMasked(Variant(g_variant_get_variant(value)).get()).get()));
    if (g_variant_is_of_type(value, G_VARIANT_TYPE("a{sv}"))
        || g_variant_is_of_type(value, G_VARIANT_TYPE("a{ss}"))) {
        GVariantBuilder dictionary;
        g_variant_builder_init(&dictionary, g_variant_get_type(value));
        for (gsize i = 0; i < g_variant_n_children(value); ++i) {
            const Variant entry(g_variant_get_child_value(value, i));
            const Variant key(g_variant_get_child_value(entry.get(), 0));
            const Variant content(g_variant_get_child_value(entry.get(), 1));
            g_variant_builder_add_value(
                &dictionary, g_variant_new_dict_entry(key.get(), maskedBehind(key, content.get()).get()));
        }
        return Variant(g_variant_builder_end(&dictionary));
    }
    return Variant::shared(value);
}

} // namespace

std::string argumentsWithoutSecrets(const JournalCall &call)
{
    const GDBusMethodInfo *method = methodOf(call);
    const std::string type = "(" + call.signature + ")";
    const Variant arguments(
        g_variant_parse(G_VARIANT_TYPE(type.c_str()), call.arguments.c_str(), nullptr, nullptr, nullptr));
    // Which argument is the secret one is only known of calls that follow the contract.
    if (!arguments || (method && hasSecret(method) && signatureOf(method) != call.signature))
        return call.signature.empty() ? call.arguments : "(***)";

    GVariantBuilder shown;
    g_variant_builder_init(&shown, G_VARIANT_TYPE_TUPLE);
    Variant previous;
    for (gsize i = 0; i < g_variant_n_children(arguments.get()); ++i) {
        const Variant argument(g_variant_get_child_value(arguments.get(), i));
        const bool masked = method && signatureOf(method) == call.signature && isSecret(method->in_args[i]);
        const Variant value = masked ? mask() : maskedBehind(previous, argument.get());
        g_variant_builder_add_value(&shown, value.get());
        previous = argument;
    }
    const GCharPointer text(g_variant_print(Variant(g_variant_builder_end(&shown)).get(), TRUE));
    return text.get();
}

} // namespace Simulator
} // namespace Corvane
