// SPDX-License-Identifier: GPL-2.0
/*
 * Cards that exist for tests alone: a driver that takes the Ethernet functions a virtual machine emulates, moves no
 * packet, and gives each one a devlink instance with a flash in memory. The functions of a slot are one card and share
 * its flash. Below debugfs, testcard/DDDD:BB:DD has what a test sets and reads; ../README.md tells of each.
 */
#include <linux/debugfs.h>
#include <linux/delay.h>
#include <linux/etherdevice.h>
#include <linux/firmware.h>
#include <linux/module.h>
#include <linux/pci.h>
#include <net/devlink.h>

#define STEPS 50
#define VERSION_SIZE 32

/* Two things are in the flash. A whole image replaces both; the second is also a component of its own. */
enum { FW, UNDI, VERSIONS };
static const char *const names[VERSIONS] = { "fw", "fw.undi" };

enum { WITHOUT_FLASH = 1 };

struct card {
	char name[16];
	struct mutex lock; /* of the versions and the content */
	char running[VERSIONS][VERSION_SIZE];
	char stored[VERSIONS][VERSION_SIZE];
	struct debugfs_blob_wrapper content;
	atomic_t flashing;
	struct dentry *folder;
	u32 fail_at, most_flashing, flashes;
	bool hold, fail_activation, lose_interface;
};

struct function {
	struct pci_dev *pci;
	struct card *card;
	struct net_device *netdev;
};

/* By slot, of the one bus. Cards outlive their functions: a flash keeps its content while no driver is bound. */
static struct card cards[32];
static struct dentry *folder;

static struct card *card_of(struct pci_dev *pci)
{
	struct card *card = &cards[PCI_SLOT(pci->devfn)];
	int i;

	if (card->folder)
		return card;
	snprintf(card->name, sizeof(card->name), "%04x:%02x:%02x", pci_domain_nr(pci->bus), pci->bus->number,
		 PCI_SLOT(pci->devfn));
	mutex_init(&card->lock);
	for (i = 0; i < VERSIONS; i++) {
		strscpy(card->running[i], "1.0.0", VERSION_SIZE);
		strscpy(card->stored[i], "1.0.0", VERSION_SIZE);
	}
	card->fail_at = U32_MAX;
	card->folder = debugfs_create_dir(card->name, folder);
	debugfs_create_bool("hold", 0600, card->folder, &card->hold);
	debugfs_create_u32("fail_at", 0600, card->folder, &card->fail_at);
	debugfs_create_bool("fail_activation", 0600, card->folder, &card->fail_activation);
	debugfs_create_bool("lose_interface", 0600, card->folder, &card->lose_interface);
	debugfs_create_u32("flashes", 0400, card->folder, &card->flashes);
	debugfs_create_atomic_t("flashing", 0400, card->folder, &card->flashing);
	debugfs_create_u32("most_flashing", 0600, card->folder, &card->most_flashing);
	debugfs_create_blob("content", 0400, card->folder, &card->content);
	return card;
}

/* Wherever an image has "TESTCARD " there follows its version, up to a line's end: an envelope may stand before it. */
static int version_of(const struct firmware *image, char *version, struct netlink_ext_ack *extack)
{
	static const char mark[] = "TESTCARD ";
	const char *found = strnstr((const char *)image->data, mark, image->size);
	const char *begin = found ? found + sizeof(mark) - 1 : NULL;
	const char *end = begin ? memchr(begin, '\n', (const char *)image->data + image->size - begin) : NULL;

	if (!end || end - begin >= VERSION_SIZE) {
		NL_SET_ERR_MSG(extack, "the image is not for a test card");
		return -EBADMSG;
	}
	memcpy(version, begin, end - begin);
	version[end - begin] = '\0';
	return 0;
}

static int write_flash(struct devlink *devlink, struct card *card, struct devlink_flash_update_params *params,
		       struct netlink_ext_ack *extack)
{
	u32 step;

	devlink_flash_update_status_notify(devlink, "Preparing to flash", params->component, 0, 0);
	devlink_flash_update_timeout_notify(devlink, "Erasing", params->component, 30);
	for (step = 0; step <= STEPS; step++) {
		if (step == card->fail_at) {
			NL_SET_ERR_MSG(extack, "the flash of the test card does not answer");
			return -EIO;
		}
		devlink_flash_update_status_notify(devlink, "Flashing", params->component,
						   params->fw->size * step / STEPS, params->fw->size);
		do
			msleep(1);
		while (READ_ONCE(card->hold) && step == STEPS / 2);
	}
	return 0;
}

static int keep_image(struct card *card, struct devlink_flash_update_params *params, const char *version)
{
	void *content = kvmalloc(params->fw->size, GFP_KERNEL);
	int i;

	if (!content)
		return -ENOMEM;
	memcpy(content, params->fw->data, params->fw->size);
	mutex_lock(&card->lock);
	kvfree(card->content.data);
	card->content.data = content;
	card->content.size = params->fw->size;
	for (i = 0; i < VERSIONS; i++)
		if (!params->component || !strcmp(params->component, names[i]))
			strscpy(card->stored[i], version, VERSION_SIZE);
	mutex_unlock(&card->lock);
	return 0;
}

static int flash_update(struct devlink *devlink, struct devlink_flash_update_params *params,
			struct netlink_ext_ack *extack)
{
	struct card *card = ((struct function *)devlink_priv(devlink))->card;
	char version[VERSION_SIZE];
	int error;

	card->most_flashing = max_t(u32, card->most_flashing, atomic_inc_return(&card->flashing));
	error = version_of(params->fw, version, extack);
	if (!error)
		error = write_flash(devlink, card, params, extack);
	if (!error)
		error = keep_image(card, params, version);
	if (!error)
		card->flashes++;
	atomic_dec(&card->flashing);
	return error;
}

static int put_versions(struct devlink_info_req *request, struct card *card, int i)
{
	/* Only fw.undi can be written by itself. */
	enum devlink_info_version_type type =
		i == UNDI ? DEVLINK_INFO_VERSION_TYPE_COMPONENT : DEVLINK_INFO_VERSION_TYPE_NONE;

	return devlink_info_version_running_put_ext(request, names[i], card->running[i], type) ?:
	       devlink_info_version_stored_put_ext(request, names[i], card->stored[i], type);
}

static int info_get(struct devlink *devlink, struct devlink_info_req *request, struct netlink_ext_ack *extack)
{
	struct function *function = devlink_priv(devlink);
	struct card *card = function->card;
	int error;

	error = devlink_info_driver_name_put(request, KBUILD_MODNAME) ?:
		devlink_info_serial_number_put(request, pci_name(function->pci)) ?:
		devlink_info_board_serial_number_put(request, card->name) ?:
		devlink_info_version_fixed_put(request, "board.id", "TESTCARD-1") ?:
		devlink_info_version_running_put(request, "fw.psid", "TST_0000000001");
	if (error)
		return error;
	mutex_lock(&card->lock);
	error = put_versions(request, card, FW) ?: put_versions(request, card, UNDI);
	mutex_unlock(&card->lock);
	return error;
}

static netdev_tx_t drop_packet(struct sk_buff *packet, struct net_device *netdev)
{
	dev_kfree_skb(packet);
	return NETDEV_TX_OK;
}

static const struct net_device_ops netdev_ops = { .ndo_start_xmit = drop_packet };

static int add_interface(struct devlink *devlink, struct function *function)
{
	u8 address[ETH_ALEN] = { 2, 0, 0, 0, function->pci->bus->number, function->pci->devfn };
	struct net_device *netdev = alloc_etherdev(0);
	int error;

	if (!netdev)
		return -ENOMEM;
	netdev->netdev_ops = &netdev_ops;
	dev_net_set(netdev, devlink_net(devlink));
	SET_NETDEV_DEV(netdev, &function->pci->dev);
	eth_hw_addr_set(netdev, address);
	error = register_netdev(netdev);
	if (error)
		free_netdev(netdev);
	else
		function->netdev = netdev;
	return error;
}

static void remove_interface(struct function *function)
{
	if (!function->netdev)
		return;
	unregister_netdev(function->netdev);
	free_netdev(function->netdev);
	function->netdev = NULL;
}

static int reload_down(struct devlink *devlink, bool moves, enum devlink_reload_action action,
		       enum devlink_reload_limit limit, struct netlink_ext_ack *extack)
{
	remove_interface(devlink_priv(devlink));
	return 0;
}

static int reload_up(struct devlink *devlink, enum devlink_reload_action action, enum devlink_reload_limit limit,
		     u32 *performed, struct netlink_ext_ack *extack)
{
	struct function *function = devlink_priv(devlink);
	struct card *card = function->card;

	*performed = BIT(DEVLINK_RELOAD_ACTION_DRIVER_REINIT);
	if (action == DEVLINK_RELOAD_ACTION_FW_ACTIVATE) {
		if (card->fail_activation) {
			NL_SET_ERR_MSG(extack, "the test card does not start its new firmware");
			return -EIO;
		}
		mutex_lock(&card->lock);
		memcpy(card->running, card->stored, sizeof(card->running));
		mutex_unlock(&card->lock);
		*performed |= BIT(action);
	}
	return card->lose_interface ? 0 : add_interface(devlink, function);
}

#define COMMON_OPERATIONS                                                                                    \
	.info_get = info_get, .reload_down = reload_down, .reload_up = reload_up,                              \
	.reload_actions = BIT(DEVLINK_RELOAD_ACTION_DRIVER_REINIT) | BIT(DEVLINK_RELOAD_ACTION_FW_ACTIVATE)

static const struct devlink_ops operations = { COMMON_OPERATIONS, .flash_update = flash_update };
static const struct devlink_ops operations_without_flash = { COMMON_OPERATIONS };

static int probe(struct pci_dev *pci, const struct pci_device_id *id)
{
	struct card *card = card_of(pci);
	struct function *function;
	struct devlink *devlink;
	int error;

	devlink = devlink_alloc(id->driver_data == WITHOUT_FLASH ? &operations_without_flash : &operations,
				sizeof(*function), &pci->dev);
	if (!devlink)
		return -ENOMEM;
	function = devlink_priv(devlink);
	function->pci = pci;
	function->card = card;
	pci_set_drvdata(pci, devlink);
	devlink_set_features(devlink, DEVLINK_F_RELOAD);
	devl_lock(devlink);
	error = add_interface(devlink, function);
	devl_unlock(devlink);
	if (error)
		devlink_free(devlink);
	else
		devlink_register(devlink);
	return error;
}

static void remove(struct pci_dev *pci)
{
	struct devlink *devlink = pci_get_drvdata(pci);

	devlink_unregister(devlink); /* waits for a flash */
	devl_lock(devlink);
	remove_interface(devlink_priv(devlink));
	devl_unlock(devlink);
	devlink_free(devlink);
}

static const struct pci_device_id ids[] = {
	{ PCI_DEVICE(0x8086, 0x100e) }, /* qemu's e1000 */
	{ PCI_DEVICE(0x8086, 0x100c), .driver_data = WITHOUT_FLASH }, /* and its e1000-82544gc */
	{}
};
MODULE_DEVICE_TABLE(pci, ids);

static struct pci_driver driver = { .name = KBUILD_MODNAME, .id_table = ids, .probe = probe, .remove = remove };

/* There is no way out: the machine goes when the tests are done. */
static int __init testcard_init(void)
{
	folder = debugfs_create_dir(KBUILD_MODNAME, NULL);
	return pci_register_driver(&driver);
}

module_init(testcard_init);
MODULE_LICENSE("GPL");
MODULE_DESCRIPTION("Ethernet cards with a flash in memory, for tests");
